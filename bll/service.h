// The business-logic service in process: a connection for one user over one
// database file, answering named operations with property-bag bytes in and
// out, the application parameters and the current user.
//
//   auto conn = pelta::bll::Connection::open("/path/pelta.db", "admin");
//   bool ok = conn->call("GetNomCurrRatios", {}, responseBytes);
//
// Opening a connection creates the file when missing and brings its schema up
// to date. A connection belongs to one thread at a time; open one connection
// per thread (or per browser session) on the same file.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <span>
#include <string>
#include <string_view>

#include "library/contracts/Bll.h"
#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace pelta::bll {

class Database;

// Where the service writes what it logs (unknown operations, failures).
class Logger {
public:
    virtual ~Logger() = default;
    virtual void log(std::string_view message) = 0;
};
// Logs to standard error, one line per message.
std::shared_ptr<Logger> stderrLogger();

// Right flags per screen.
namespace rights {
inline constexpr int32_t OpenDetails = 4;
inline constexpr int32_t Create = 8;
inline constexpr int32_t Edit = 16;
inline constexpr int32_t Delete = 32;
// What a member of an administrators' group holds on every screen.
inline constexpr int32_t All = 0x7FFFFFFF;
}  // namespace rights

// Opens (creating when missing) the database file and applies the migrations
// it lacks. Raises pelta::Error when the file cannot be opened or is newer
// than this program.
std::unique_ptr<Database> openDatabase(const std::string& path);
// The schema version this program brings a database to.
int schemaVersion();

class Connection final : public PeltaNom15::IBllConnection {
public:
    // Opens a connection to `path` for the user whose login name is
    // `userName`. Raises pelta::Error for an unknown or inactive user.
    static pelta::Ref<Connection> open(const std::string& path, std::string_view userName,
                                       std::shared_ptr<Logger> logger = stderrLogger());
    ~Connection() override;

    // Calls the operation with the request bag's bytes (empty: no
    // parameters); fills the response bytes and answers the success flag.
    // False for an unknown operation, a malformed request or a failure of the
    // database; a refusal (BllError in the response) is a success.
    bool call(std::string_view operation, std::span<const uint8_t> request, Bytes& response);

    // IBllConnection.
    void Call(int32_t CallKind, const std::string& Operation, const Bytes& Request, Bytes& Response,
              int32_t Reserved, ObjectRef& Context, const std::string& Options,
              bool& Success) override;
    Ref<PeltaNom15::IAppParameters> AppParameters() override;
    std::string CurrentUserID() override;
    std::string CurrentUserName() override;

    // The rights flags of the current user on a screen ("ctxRatios").
    int32_t userRights(std::string_view screen);

    Database& database() noexcept { return *db_; }
    std::string typeName() const override { return "BllConnection"; }

private:
    Connection(std::unique_ptr<Database> db, std::string userId, std::string userName,
               std::shared_ptr<Logger> logger);

    std::unique_ptr<Database> db_;
    std::string userId_;
    std::string userName_;
    std::shared_ptr<Logger> logger_;
};

// The deterministic demo data: the same options give the same database, keys
// and dates included.
struct DemoOptions {
    int banks = 3;              // banks publishing rates (at least 1)
    int rateDays = 30;          // days of rates per bank
    int currenciesPerRate = 4;  // rows per rate record (at most the currencies known)
    int partners = 40;          // business partners
    int items = 40;             // items of the catalogue (0 to 1,000,000)
    // The supplier price-list type and a type generated from the default one
    // with its mark-ups (offered among the price-list types everywhere).
    bool generatedPrices = false;
    uint64_t seed = 20240101;
};
// Fills an empty, migrated database: users `admin` (administrators) and
// `operator` (may open currency rates, not change them), currencies, banks,
// rates, the application parameters, and a catalogue of `items` items with
// their measures, barcodes, supplier codes, prices, stock and discounts, the
// reference lists of the item's form, lots and bills of materials (see
// demo_items.cpp). One transaction, prepared statements.
void generateDemo(Database& db, const DemoOptions& options = {});
// Creates the file at `path` (replacing nothing: raises when it exists) and
// fills it with generateDemo.
void createDemoDatabase(const std::string& path, const DemoOptions& options = {});

}  // namespace pelta::bll
