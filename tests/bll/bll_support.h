// Shared helpers of the service tests: a temporary demo database, calls
// through bag bytes exactly as the library makes them, and a dump of every
// table to compare a database before and after a refused call.
#pragma once

#include <gtest/gtest.h>

#include <unistd.h>

#include <filesystem>
#include <string>
#include <vector>

#include "bll/database.h"
#include "bll/service.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace bll_test {

using pelta::Ref;
using pelta::Variant;

// Collects what the service logs.
class RecordingLogger : public pelta::bll::Logger {
public:
    void log(std::string_view message) override { lines.emplace_back(message); }
    std::vector<std::string> lines;
};

struct Reply {
    bool success = false;
    Ref<pelta::PropertyBag> bag;

    Variant get(std::string_view name) const { return bag->readProperty(name); }
    bool has(std::string_view name) const { return bag->hasProperty(name); }
    Ref<pelta::Recordset> rs(std::string_view name) const {
        Variant v = bag->readProperty(name);
        return Ref<pelta::Recordset>(pelta::query<pelta::Recordset>(v.object()));
    }
    int32_t bllError() const {
        Variant v = bag->readProperty("BllError");
        return v.isEmpty() ? 0 : v.toLong();
    }
};

// Calls through IBllConnection with the request bag's bytes (empty bytes when
// the bag is null), then opens the response bag.
inline Reply call(PeltaNom15::IBllConnection& conn, const std::string& op,
                  const pelta::PropertyBag* request = nullptr) {
    pelta::Bytes req = request ? request->contents() : pelta::Bytes{};
    pelta::Bytes resp;
    pelta::ObjectRef context;
    Reply r;
    conn.Call(PeltaNom15::kBllCallKind, op, req, resp, 0, context, "", r.success);
    r.bag = pelta::PropertyBag::fromContents(resp);
    return r;
}

// Every table's rows as text, in key order.
inline std::string dump(const std::string& path) {
    auto db = pelta::bll::openSqlite(path);
    std::string out;
    for (const std::string& t : db->tables()) {
        out += "[" + t + "]\n";
        auto st = db->prepare("SELECT * FROM " + db->quote(t) + " ORDER BY 1, 2");
        while (st->step()) {
            for (int c = 0; c < st->columnCount(); ++c) {
                Variant v = st->value(c);
                out += v.isNull() ? std::string("<null>") : v.toString();
                out += '|';
            }
            out += '\n';
        }
    }
    return out;
}

class BllTest : public ::testing::Test {
protected:
    void SetUp() override {
        dir_ = std::filesystem::temp_directory_path() /
               ("pelta_bll_" + std::to_string(::getpid()) + "_" +
                ::testing::UnitTest::GetInstance()->current_test_info()->name());
        std::filesystem::remove_all(dir_);
        std::filesystem::create_directories(dir_);
        path_ = (dir_ / "demo.db").string();
        pelta::bll::DemoOptions o;
        o.banks = 2;
        o.rateDays = 3;
        o.currenciesPerRate = 3;
        pelta::bll::createDemoDatabase(path_, o);
        logger_ = std::make_shared<RecordingLogger>();
        admin_ = pelta::bll::Connection::open(path_, "admin", logger_);
    }
    void TearDown() override {
        admin_.reset();
        std::filesystem::remove_all(dir_);
    }

    // A scalar of the first row of a query on the admin's connection.
    Variant scalar(const std::string& sql, const std::vector<Variant>& params = {}) {
        auto st = admin_->database().prepare(sql);
        for (size_t i = 0; i < params.size(); ++i)
            st->bind(static_cast<int>(i + 1), params[i]);
        if (!st->step()) return Variant::null();
        return st->value(0);
    }
    std::string currencyId(const std::string& code) {
        Variant v = scalar("SELECT ID FROM nom_currencies WHERE Code = ?1", {Variant(code)});
        return v.isNull() ? std::string() : v.toString();
    }
    std::string bankId(const std::string& name) {
        Variant v = scalar("SELECT ID FROM nom_banks WHERE Name = ?1", {Variant(name)});
        return v.isNull() ? std::string() : v.toString();
    }

    std::filesystem::path dir_;
    std::string path_;
    std::shared_ptr<RecordingLogger> logger_;
    Ref<pelta::bll::Connection> admin_;
};

}  // namespace bll_test
