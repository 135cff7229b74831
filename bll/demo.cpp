// The deterministic demo data. Keys, dates and rates come from a seeded
// generator whose sequence the language fixes (mt19937_64), so the same
// options give the same database on every machine.
#include <filesystem>
#include <random>

#include "bll/database.h"
#include "bll/demo_items.h"
#include "bll/demo_partners.h"
#include "bll/service.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr const char* kAdminId = "{0B9E3D5A-1C2F-4A6B-8D7E-3F5A9C1B2E40}";

struct CurrencySeed {
    const char* code;
    const char* name;
    int64_t rate;  // BGN per `units`, scaled by 10^6
    int units;
};

// The national currency first; rates are against it.
constexpr CurrencySeed kCurrencies[] = {
    {"BGN", "Български лев", 1000000, 1},    {"EUR", "Евро", 1955830, 1},
    {"USD", "Щатски долар", 1802460, 1},     {"GBP", "Британска лира", 2285170, 1},
    {"CHF", "Швейцарски франк", 2049960, 1}, {"JPY", "Японска йена", 1216180, 100},
    {"RON", "Румънска лея", 393090, 1},      {"TRY", "Турска лира", 55900, 1},
    {"CZK", "Чешка крона", 78150, 1},        {"DKK", "Датска крона", 262200, 1},
    {"HUF", "Унгарски форинт", 499210, 100}, {"PLN", "Полска злота", 452780, 1},
    {"SEK", "Шведска крона", 168950, 1},     {"NOK", "Норвежка крона", 164720, 1},
    {"CAD", "Канадски долар", 1317310, 1},   {"AUD", "Австралийски долар", 1180570, 1},
};
constexpr int kCurrencyCount = static_cast<int>(std::size(kCurrencies));

class Keys {
public:
    explicit Keys(uint64_t seed) : rng_(seed) {}
    std::string next() {
        Guid g;
        for (int i = 0; i < 16; i += 8) {
            uint64_t v = rng_();
            for (int k = 0; k < 8; ++k)
                g.bytes[i + k] = static_cast<uint8_t>(v >> (8 * k));
        }
        g.bytes[6] = static_cast<uint8_t>((g.bytes[6] & 0x0F) | 0x40);
        g.bytes[8] = static_cast<uint8_t>((g.bytes[8] & 0x3F) | 0x80);
        return g.toString();
    }
    uint64_t number() { return rng_(); }

private:
    std::mt19937_64 rng_;
};

}  // namespace

void generateDemo(Database& db, const DemoOptions& o) {
    const int banks = std::max(1, o.banks);
    const int days = std::max(0, o.rateDays);
    const int perRate = std::clamp(o.currenciesPerRate, 0, kCurrencyCount - 1);
    Keys keys(o.seed);
    const Date base = makeDate(2024, 1, 2);
    const Date stamp = makeDate(2024, 1, 1, 9, 0, 0);
    const ColumnType guid = ColumnType::parse("GUID").value();
    const ColumnType day = ColumnType::parse("DATE").value();
    const ColumnType rate = ColumnType::parse("DECIMAL(18,6)").value();
    const Variant admin(kAdminId);

    Transaction tx(db, true);

    // A restricted user: may open currency rates and the reference lists,
    // may change nothing.
    std::string operatorGroup = keys.next();
    std::string operatorUser = keys.next();
    {
        auto g =
            db.prepare("INSERT INTO sec_groups (ID, Name, IsAdmin) VALUES (?1, 'Operators', 0)");
        g->bindText(1, operatorGroup);
        g->step();
        auto u = db.prepare(
            "INSERT INTO sec_users (ID, Name, FullName, IsActive) VALUES (?1, 'operator', "
            "'Operator', 1)");
        u->bindText(1, operatorUser);
        u->step();
        auto m = db.prepare("INSERT INTO sec_usergroups (User_ID, Group_ID) VALUES (?1, ?2)");
        m->bindText(1, operatorUser);
        m->bindText(2, operatorGroup);
        m->step();
        auto r = db.prepare(
            "INSERT INTO sec_grouprights (Group_ID, Screen, Rights) VALUES (?1, ?2, ?3)");
        for (const char* screen : {"ctxRatios", "ctxCurrencies", "ctxBanks"}) {
            r->reset();
            r->bindText(1, operatorGroup);
            r->bindText(2, screen);
            r->bindInt64(3, rights::OpenDetails);
            r->step();
        }
    }

    std::vector<std::string> currencyIds;
    {
        auto c = db.prepare(
            "INSERT INTO nom_currencies (ID, Code, Name, IsActive, CU, CD, LU, LD) "
            "VALUES (?1, ?2, ?3, 1, ?4, ?5, ?4, ?5)");
        for (const CurrencySeed& s : kCurrencies) {
            currencyIds.push_back(keys.next());
            c->reset();
            c->bindText(1, currencyIds.back());
            c->bindText(2, s.code);
            c->bindText(3, s.name);
            c->bind(4, admin, guid);
            c->bind(5, Variant(stamp));
            c->step();
        }
    }

    std::vector<std::string> bankIds;
    {
        auto b = db.prepare(
            "INSERT INTO nom_banks (ID, Name, Description, GroupName, IsActive, CU, CD, LU, LD) "
            "VALUES (?1, ?2, ?3, ?4, 1, ?5, ?6, ?5, ?6)");
        for (int i = 0; i < banks; ++i) {
            bankIds.push_back(keys.next());
            b->reset();
            b->bindText(1, bankIds.back());
            if (i == 0) {
                b->bindText(2, "БНБ");
                b->bindText(3, "Българска народна банка");
                b->bindText(4, "Централни банки");
            } else {
                b->bindText(2, "Банка " + std::to_string(i));
                b->bindText(3, "Търговска банка " + std::to_string(i));
                b->bindText(4, "Търговски банки");
            }
            b->bind(5, admin, guid);
            b->bind(6, Variant(stamp));
            b->step();
        }
    }

    auto head = db.prepare(
        "INSERT INTO nom_currratios (ID, Date, IsActive, Pr_ID, Note, CU, CD, LU, LD) "
        "VALUES (?1, ?2, ?3, ?4, NULL, ?5, ?6, ?5, ?6)");
    auto row = db.prepare(
        "INSERT INTO nom_currratiosdetails (ID, CurrRatio_ID, Currency_ID, Pr_ID, Date, Units, "
        "Rate) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7)");
    for (int b = 0; b < banks; ++b) {
        for (int d = 0; d < days; ++d) {
            std::string id = keys.next();
            Variant date(Date{base.oa + d});
            head->reset();
            head->bindText(1, id);
            head->bind(2, date, day);
            // Older rates of commercial banks are kept inactive now and then.
            head->bindInt64(3, (b > 0 && keys.number() % 10 == 0) ? 0 : 1);
            head->bind(4, Variant(bankIds[b]), guid);
            head->bind(5, admin, guid);
            head->bind(6, Variant(Date{stamp.oa + d}));
            head->step();
            for (int c = 1; c <= perRate; ++c) {
                const CurrencySeed& s = kCurrencies[c];
                // Within half a percent of the seed rate, in whole millionths.
                int64_t swing = static_cast<int64_t>(keys.number() % 1001) - 500;
                int64_t scaled = s.rate + s.rate * swing / 100000;
                row->reset();
                row->bindText(1, keys.next());
                row->bindText(2, id);
                row->bind(3, Variant(currencyIds[c]), guid);
                row->bind(4, Variant(bankIds[b]), guid);
                row->bind(5, date, day);
                row->bindInt64(6, s.units);
                row->bind(7,
                          Variant(Decimal::fromParts(static_cast<uint64_t>(scaled), 0, 6, false)),
                          rate);
                row->step();
            }
        }
    }

    auto set = db.prepare("UPDATE sys_settings SET Value = ?2 WHERE Name = ?1");
    auto put = [&](const char* name, const std::string& value) {
        set->reset();
        set->bindText(1, name);
        set->bindText(2, value);
        set->step();
    };
    put("DefCurrency_ID", currencyIds[0]);
    put("DefVatPriceScale", "2");
    put("DefItmDimensionName", "Дименсии на продукти");
    put("DefCgDimensionName", "Дименсии на контрагенти");
    generatePartnersDemo(db, o);
    generateDemoItems(db, DemoItemsContext{currencyIds}, std::clamp(o.items, 0, 1000000), o.seed);
    generateDemoItemDetails(db, o.seed, o.generatedPrices);
    tx.commit();
}

void createDemoDatabase(const std::string& path, const DemoOptions& options) {
    if (std::filesystem::exists(path))
        raise(errc::Fail, "The file " + path + " exists already", "Demo");
    auto db = openDatabase(path);
    generateDemo(*db, options);
}

}  // namespace pelta::bll
