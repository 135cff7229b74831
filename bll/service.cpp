// The connection: dispatch of operations by name inside one transaction each,
// refusals into the response, application parameters and the current user.
#include "bll/service.h"

#include <iostream>
#include <mutex>

#include "bll/database.h"
#include "bll/operations.h"
#include "platform/data/propertybag.h"

namespace pelta::bll {

namespace {

class StderrLogger final : public Logger {
public:
    void log(std::string_view message) override {
        static std::mutex m;
        std::lock_guard lock(m);
        std::cerr << "pelta-bll: " << message << '\n';
    }
};

class AppParameter final : public PeltaNom15::IAppParameter {
public:
    explicit AppParameter(Variant v) : value_(std::move(v)) {}
    Variant Value() override { return value_; }
    Variant invoke(std::string_view member, CallKind kind, std::span<Variant> args) override {
        if (memberIs(member, "Value") && args.empty()) return value_;
        return Object::invoke(member, kind, args);
    }
    std::string typeName() const override { return "AppParameter"; }

private:
    Variant value_;
};

Variant settingValue(std::string_view kind, const Variant& text) {
    if (text.isNull()) return Variant::null();
    const std::string& s = text.str();
    if (kind == "Long") return Variant(Variant(s).toLong());
    if (kind == "Boolean") return Variant(s == "1" || s == "True" || s == "true");
    if (kind == "Decimal") {
        if (auto d = Decimal::parse(s)) return Variant(*d);
        return Variant::null();
    }
    if (kind == "Date") {
        if (auto d = Decimal::parse(s)) return Variant(Date{d->toDouble()});
        return Variant::null();
    }
    return text;
}

// Read at each request, so that a change made through another connection is
// seen at once.
class AppParameters final : public PeltaNom15::IAppParameters {
public:
    explicit AppParameters(Ref<Connection> conn) : conn_(std::move(conn)) {}
    Ref<PeltaNom15::IAppParameter> Item(const std::string& name) override {
        auto st = conn_->database().prepare(
            "SELECT Kind, Value FROM sys_settings WHERE Name = ?1 COLLATE NOCASE");
        st->bindText(1, name);
        if (!st->step()) return {};
        return makeRef<AppParameter>(settingValue(st->text(0), st->value(1)));
    }
    Variant invoke(std::string_view member, CallKind kind, std::span<Variant> args) override {
        if (memberIs(member, "Item") && args.size() == 1) {
            auto p = Item(args[0].toString());
            return p ? Variant(ObjectRef(p)) : Variant::nothing();
        }
        return Object::invoke(member, kind, args);
    }
    std::string typeName() const override { return "AppParameters"; }

private:
    Ref<Connection> conn_;
};

}  // namespace

std::shared_ptr<Logger> stderrLogger() {
    static auto logger = std::make_shared<StderrLogger>();
    return logger;
}

Ref<Connection> Connection::open(const std::string& path, std::string_view userName,
                                 std::shared_ptr<Logger> logger) {
    auto db = openDatabase(path);
    auto st = db->prepare("SELECT ID, Name, IsActive FROM sec_users WHERE Name = ?1");
    st->bindText(1, userName);
    if (!st->step()) raise(errc::Fail, "Unknown user " + std::string(userName), "BllConnection");
    if (st->int64(2) == 0)
        raise(errc::Fail, "The user " + std::string(userName) + " is not active", "BllConnection");
    std::string id(st->text(0));
    std::string name(st->text(1));
    st.reset();
    return Ref<Connection>(new Connection(std::move(db), std::move(id), std::move(name),
                                          logger ? std::move(logger) : stderrLogger()));
}

Connection::Connection(std::unique_ptr<Database> db, std::string userId, std::string userName,
                       std::shared_ptr<Logger> logger)
    : db_(std::move(db)),
      userId_(std::move(userId)),
      userName_(std::move(userName)),
      logger_(std::move(logger)) {}

Connection::~Connection() = default;

int32_t Connection::userRights(std::string_view screen) {
    auto st = db_->prepare(
        "SELECT g.IsAdmin, r.Rights FROM sec_usergroups ug "
        "JOIN sec_groups g ON g.ID = ug.Group_ID "
        "LEFT JOIN sec_grouprights r ON r.Group_ID = g.ID AND r.Screen = ?2 COLLATE NOCASE "
        "WHERE ug.User_ID = ?1");
    st->bindText(1, userId_);
    st->bindText(2, screen);
    int32_t rights = 0;
    while (st->step()) {
        if (st->int64(0) != 0) return rights::All;
        if (!st->isNull(1)) rights |= static_cast<int32_t>(st->int64(1));
    }
    return rights;
}

bool Connection::call(std::string_view operation, std::span<const uint8_t> request,
                      Bytes& response) {
    response.clear();
    const OperationDef* op = operations().find(operation);
    if (!op) {
        logger_->log("Unknown operation " + std::string(operation));
        return false;
    }
    try {
        auto req = PropertyBag::fromContents(request);
        PropertyBag resp;
        OperationContext ctx{*db_,  *req,
                             resp,  userId_,
                             now(), [this](std::string_view screen) { return userRights(screen); }};
        Transaction tx(*db_, op->writes);
        try {
            op->fn(ctx);
            tx.commit();
        } catch (const Refusal& r) {
            // Nothing of a refused call stays: the transaction rolls back and
            // the response carries only the refusal.
            db_->rollback();
            PropertyBag refused;
            refused.writeProperty("BllError", Variant(r.code()));
            for (const auto& [name, value] : r.properties())
                refused.writeProperty(name, value);
            response = refused.contents();
            return true;
        }
        response = resp.contents();
        return true;
    } catch (const Error& e) {
        logger_->log(std::string(operation) + " failed: " + e.description() + " (" +
                     std::to_string(e.number()) + ", " + e.source() + ")");
    } catch (const std::exception& e) {
        logger_->log(std::string(operation) + " failed: " + e.what());
    }
    response.clear();
    return false;
}

void Connection::Call(int32_t CallKind, const std::string& Operation, const Bytes& Request,
                      Bytes& Response, int32_t Reserved, ObjectRef& Context,
                      const std::string& Options, bool& Success) {
    Context.reset();
    Success = call(Operation, Request, Response);
}

Ref<PeltaNom15::IAppParameters> Connection::AppParameters() {
    return makeRef<bll::AppParameters>(Ref<Connection>(this));
}

std::string Connection::CurrentUserID() {
    return userId_;
}
std::string Connection::CurrentUserName() {
    return userName_;
}

}  // namespace pelta::bll
