// The demo catalogue: items with measures, barcodes (every hundredth item is
// sold by weight and carries a weight-barcode template), supplier codes,
// prices of the retail type in two currencies and two measures, stock in the
// central store, and discounts; then what the item's detail form shows
// beside them: reference lists, a generated price list, lots and bills of
// materials of the last items. Deterministic from the seed; written with
// prepared statements inside the caller's transaction, so that a million
// items take seconds, not hours.
#include <array>
#include <cstdio>
#include <map>
#include <random>
#include <tuple>

#include "bll/database.h"
#include "bll/demo_items.h"
#include "bll/items.h"
#include "bll/pricing.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr const char* kAdminId = "{0B9E3D5A-1C2F-4A6B-8D7E-3F5A9C1B2E40}";

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
    uint64_t number(uint64_t below) { return rng_() % below; }

private:
    std::mt19937_64 rng_;
};

struct Named {
    const char* code;
    const char* name;
};

constexpr Named kMeasures[] = {
    {"бр", "Брой"}, {"кг", "Килограм"}, {"каш", "Кашон"}, {"л", "Литър"}, {"м", "Метър"},
};
enum { kPiece, kKilogram, kBox, kLitre, kMetre };

constexpr const char* kTypes[] = {"Стока", "Материал", "Продукт", "Услуга"};
constexpr const char* kGroups[] = {"Храни", "Напитки", "Битова химия", "Канцелария", "Електроника"};
constexpr const char* kNouns[] = {"Кафе",    "Чай",      "Захар", "Брашно",  "Олио",  "Сапун",
                                  "Химикал", "Тетрадка", "Кабел", "Батерия", "Сок",   "Вода",
                                  "Ориз",    "Сирене",   "Мляко", "Лампа",   "Папка", "Препарат"};
constexpr const char* kKinds[] = {"класик", "премиум", "еко", "био", "екстра", "лайт", "макс"};

std::string digits(uint64_t n, int width) {
    char buf[32];
    std::snprintf(buf, sizeof buf, "%0*llu", width, static_cast<unsigned long long>(n));
    return buf;
}

// The check digit of an EAN-13 over its first twelve digits.
char eanCheck(const std::string& twelve) {
    int sum = 0;
    for (size_t i = 0; i < 12; ++i)
        sum += (twelve[i] - '0') * (i % 2 ? 3 : 1);
    return static_cast<char>('0' + (10 - sum % 10) % 10);
}

Variant money(int64_t cents, int scale = 2) {
    const bool neg = cents < 0;
    return Variant(Decimal::fromParts(static_cast<uint64_t>(neg ? -cents : cents), 0, scale, neg));
}

}  // namespace

void generateDemoItems(Database& db, const DemoItemsContext& c, int count, uint64_t seed) {
    Keys keys(seed ^ 0x5EED17E45ULL);
    const ColumnType guid = ColumnType::parse("GUID").value();
    const ColumnType price = ColumnType::parse("DECIMAL(18,8)").value();
    const ColumnType qty = ColumnType::parse("DECIMAL(18,6)").value();
    const ColumnType sum = ColumnType::parse("DECIMAL(18,4)").value();
    const ColumnType pct = ColumnType::parse("DECIMAL(9,4)").value();
    const Variant admin(kAdminId);
    const Variant stamp(makeDate(2024, 1, 1, 9, 0, 0));
    // Room for every page the catalogue touches, so that the one transaction
    // never spills pages to the journal before it commits.
    db.execute("PRAGMA cache_size = -3145728");

    std::array<std::string, std::size(kMeasures)> measure;
    {
        auto st = db.prepare(
            "INSERT INTO nom_measures (ID, Code, Name, IsActive, CU, CD, LU, LD) "
            "VALUES (?1, ?2, ?3, 1, ?4, ?5, ?4, ?5)");
        for (size_t i = 0; i < std::size(kMeasures); ++i) {
            measure[i] = keys.next();
            st->reset();
            st->bindText(1, measure[i]);
            st->bindText(2, kMeasures[i].code);
            st->bindText(3, kMeasures[i].name);
            st->bind(4, admin, guid);
            st->bind(5, stamp);
            st->step();
        }
    }
    std::vector<std::string> types;
    {
        auto st = db.prepare("INSERT INTO nom_itemtypes (ID, Name, IsActive) VALUES (?1, ?2, 1)");
        for (const char* t : kTypes) {
            types.push_back(keys.next());
            st->reset();
            st->bindText(1, types.back());
            st->bindText(2, t);
            st->step();
        }
    }
    std::vector<std::string> groups;
    {
        const std::string dimension = keys.next();
        auto d = db.prepare("INSERT INTO nom_dimensions (ID, Name, IsActive) VALUES (?1, ?2, 1)");
        d->bindText(1, dimension);
        d->bindText(2, "Групи продукти");
        d->step();
        auto v = db.prepare(
            "INSERT INTO nom_dimvalues (ID, Dimension_ID, Name, FullName, IsActive) "
            "VALUES (?1, ?2, ?3, ?4, 1)");
        for (const char* g : kGroups) {
            groups.push_back(keys.next());
            v->reset();
            v->bindText(1, groups.back());
            v->bindText(2, dimension);
            v->bindText(3, g);
            v->bindText(4, std::string("Групи продукти\\") + g);
            v->step();
        }
    }
    std::vector<std::string> stores;
    {
        auto st =
            db.prepare("INSERT INTO nom_stores (ID, Code, Name, IsActive) VALUES (?1, ?2, ?3, 1)");
        for (const Named& s : {Named{"1", "Централен склад"}, Named{"2", "Магазин"}}) {
            stores.push_back(keys.next());
            st->reset();
            st->bindText(1, stores.back());
            st->bindText(2, s.code);
            st->bindText(3, s.name);
            st->step();
        }
    }
    {
        // The defaults a new item starts with.
        auto def = [&](const char* sql, const std::string& id) {
            auto st = db.prepare(sql);
            st->bindText(1, id);
            st->step();
        };
        def("UPDATE nom_itemtypes SET IsDef = 1 WHERE ID = ?1", types[0]);
        def("UPDATE nom_itemtypes SET IsService = 1 WHERE ID = ?1", types[3]);
        def("UPDATE nom_measures SET IsDef = 1 WHERE ID = ?1", measure[kPiece]);
        def("UPDATE sys_settings SET Value = ?1 WHERE Name = 'DefCgStore_ID'", stores[0]);
        def("UPDATE sys_settings SET Value = (SELECT Dimension_ID FROM nom_dimvalues WHERE ID = "
            "?1) WHERE Name = 'DefItmDimension_ID'",
            groups[0]);
    }
    std::vector<std::string> plTypes;
    {
        auto st = db.prepare(
            "INSERT INTO nom_pricelisttypes (ID, Code, Name, IsPromo, IsActive, CU, CD, LU, LD) "
            "VALUES (?1, ?2, ?3, ?4, 1, ?5, ?6, ?5, ?6)");
        const struct {
            const char* code;
            const char* name;
            int promo;
        } kTypesOfPrices[] = {{"1", "Дребно", 0}, {"2", "Едро", 0}, {"3", "Промоция", 1}};
        for (const auto& t : kTypesOfPrices) {
            plTypes.push_back(keys.next());
            st->reset();
            st->bindText(1, plTypes.back());
            st->bindText(2, t.code);
            st->bindText(3, t.name);
            st->bindInt64(4, t.promo);
            st->bind(5, admin, guid);
            st->bind(6, stamp);
            st->step();
        }
    }
    const std::string schema = keys.next();
    {
        auto st = db.prepare(
            "INSERT INTO nom_discountschemas (ID, Name, IsActive) VALUES (?1, 'Лоялни клиенти', "
            "1)");
        st->bindText(1, schema);
        st->step();
    }

    auto item = db.prepare(
        "INSERT INTO nom_items (ID, Code, Name, Name2, ItmType_ID, DimValue_ID, Measure_ID, "
        "SecMeasure_ID, DefCurrency_ID, IsVat, IsVatAllowed, Vat, VatPriceScale, MinOrderQuo, "
        "WeightNeto, BomCount, Categories, BarCodes, BarPrefixes, BarMeasures, SupplCodes, "
        "SupplMeasures, IsActive, Note, CU, CD, LU, LD) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8, "
        "?9, 1, 1, ?10, 2, ?11, ?12, 0, ?13, ?14, ?15, ?16, ?17, ?18, ?19, ?20, ?21, ?22, ?21, "
        "?22)");
    auto ratio = db.prepare(
        "INSERT INTO nom_itemsmeasures (ID, Itm_ID, Measure_ID, Ratio, RatioPerUnits, RatioCoeff) "
        "VALUES (?1, ?2, ?3, ?4, 1000000, ?4)");
    auto barcode = db.prepare(
        "INSERT INTO nom_itemsbarcodes (ID, Itm_ID, BarCode, Measure_ID, Type) "
        "VALUES (?1, ?2, ?3, ?4, ?5)");
    auto suppl = db.prepare(
        "INSERT INTO nom_itemssupplcodes (ID, Itm_ID, Cg_ID, Code, Measure_ID) "
        "VALUES (?1, ?2, NULL, ?3, ?4)");
    auto priceRow = db.prepare(
        "INSERT INTO nom_prices (ID, PlType_ID, Cg_ID, Itm_ID, Currency_ID, Measure_ID, "
        "BasePrice, BasePriceWithVat, LD) VALUES (?1, ?2, NULL, ?3, ?4, ?5, ?6, ?7, ?8)");
    auto saldo = db.prepare(
        "INSERT INTO nom_storesaldo (ID, Store_ID, Itm_ID, Quantity, QuantityReserved, "
        "QuantitySecMeasure, TotalSum, MinQuantity) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8)");
    auto discount = db.prepare(
        "INSERT INTO nom_discountitems (ID, Schema_ID, Itm_ID, Discount) VALUES (?1, ?2, ?3, ?4)");

    auto addPrice = [&](const std::string& id, const std::string& type, const std::string& currency,
                        const std::string& m, int64_t cents, int vatPercent) {
        priceRow->reset();
        priceRow->bindText(1, keys.next());
        priceRow->bindText(2, type);
        priceRow->bindText(3, id);
        priceRow->bindText(4, currency);
        priceRow->bindText(5, m);
        priceRow->bind(6, money(cents), price);
        // With VAT, to the cent, half away from zero.
        priceRow->bind(7, money((cents * (100 + vatPercent) + 50) / 100), price);
        priceRow->bind(8, stamp);
        priceRow->step();
    };

    const std::string& bgn = c.currencyIds.at(0);
    const std::string& eur = c.currencyIds.at(1);
    for (int n = 1; n <= count; ++n) {
        const std::string id = keys.next();
        const bool byWeight = n % 100 == 0;
        const int base = byWeight ? kKilogram : (n % 7 == 0 ? kLitre : kPiece);
        const int boxOf = byWeight ? 10 : 6 * static_cast<int>(1 + keys.number(4));  // 6..24
        const int vat = n % 10 == 0 ? 9 : 20;
        const std::string code = digits(static_cast<uint64_t>(n), 7);
        const char* noun = kNouns[keys.number(std::size(kNouns))];
        const char* kind = kKinds[keys.number(std::size(kKinds))];
        const std::string group = groups[static_cast<size_t>(n) % groups.size()];

        // Barcodes: the piece's EAN-13 and the box's; a weight item instead
        // carries the template of its scale label (prefix 29 and its PLU).
        std::vector<std::string> codes, measures, prefixes;
        const std::string ean = "380" + digits(static_cast<uint64_t>(n), 9);
        if (byWeight) {
            const std::string templ =
                "29" + digits(static_cast<uint64_t>(n / 100) % 100000, 5) + "ww.wwwc";
            codes = {templ};
            measures = {measure[kKilogram]};
            prefixes = {barcodePrefix(templ)};
        } else {
            const std::string box = "390" + digits(static_cast<uint64_t>(n), 9);
            codes = {ean + eanCheck(ean), box + eanCheck(box)};
            measures = {measure[base], measure[kBox]};
        }
        const bool hasSuppl = n % 2 == 0;
        const std::string supplCode = "SUP-" + digits(static_cast<uint64_t>(n), 7);

        item->reset();
        item->bindText(1, id);
        item->bindText(2, code);
        item->bindText(3, std::string(noun) + " " + kind + " " + std::to_string(n));
        item->bindText(4, "Item " + std::to_string(n));
        item->bindText(5, types[static_cast<size_t>(n) % types.size()]);
        item->bindText(6, group);
        item->bindText(7, measure[base]);
        item->bindText(8, measure[kBox]);
        item->bindText(9, n % 5 == 0 ? eur : bgn);
        item->bind(10, Variant(Decimal(vat)), pct);
        item->bind(11, money(n % 3 == 0 ? 1000000 : 0, 6), qty);
        item->bind(12, money(byWeight ? 1000000 : 250000, 6), qty);
        item->bindText(13, composeCodeList({group}));
        item->bindText(14, composeCodeList(codes));
        if (prefixes.empty())
            item->bindNull(15);
        else
            item->bindText(15, composeCodeList(prefixes));
        item->bindText(16, composeCodeList(measures));
        if (hasSuppl) {
            item->bindText(17, composeCodeList({supplCode}));
            item->bindText(18, composeCodeList({measure[kBox]}));
        } else {
            item->bindNull(17);
            item->bindNull(18);
        }
        item->bindInt64(19, n % 50 == 0 ? 0 : 1);
        if (n % 11 == 0)
            item->bindText(20, "Сезонен артикул");
        else
            item->bindNull(20);
        item->bind(21, admin, guid);
        item->bind(22, stamp);
        item->step();

        ratio->reset();
        ratio->bindText(1, keys.next());
        ratio->bindText(2, id);
        ratio->bindText(3, measure[kBox]);
        ratio->bind(4, Variant(Decimal(boxOf)), qty);
        ratio->step();

        for (size_t b = 0; b < codes.size(); ++b) {
            barcode->reset();
            barcode->bindText(1, keys.next());
            barcode->bindText(2, id);
            barcode->bindText(3, codes[b]);
            barcode->bindText(4, measures[b]);
            barcode->bindInt64(5, byWeight ? -1 : 1);  // a weight template, else EAN-13
            barcode->step();
        }
        if (hasSuppl) {
            suppl->reset();
            suppl->bindText(1, keys.next());
            suppl->bindText(2, id);
            suppl->bindText(3, supplCode);
            suppl->bindText(4, measure[kBox]);
            suppl->step();
        }

        // Retail prices in both currencies and both measures; wholesale for
        // every tenth item in its base measure only.
        const int64_t cents = 50 + static_cast<int64_t>(keys.number(50000));
        const int64_t euroCents = (cents * 100000 + 97791) / 195583;  // at 1.95583, to the cent
        addPrice(id, plTypes[0], bgn, measure[base], cents, vat);
        addPrice(id, plTypes[0], bgn, measure[kBox], cents * boxOf, vat);
        addPrice(id, plTypes[0], eur, measure[base], euroCents, vat);
        addPrice(id, plTypes[0], eur, measure[kBox], euroCents * boxOf, vat);
        if (n % 10 == 0) addPrice(id, plTypes[1], bgn, measure[base], cents * 9 / 10, vat);

        const int64_t quantity = static_cast<int64_t>(keys.number(500));
        saldo->reset();
        saldo->bindText(1, keys.next());
        saldo->bindText(2, stores[0]);
        saldo->bindText(3, id);
        saldo->bind(4, Variant(Decimal(quantity)), qty);
        saldo->bind(5, Variant(Decimal(static_cast<int64_t>(keys.number(10)))), qty);
        saldo->bind(6, Variant(Decimal(quantity) / Decimal(boxOf)), qty);
        saldo->bind(7, money(quantity * cents * 8 / 10, 2), sum);
        if (n % 3 == 0)
            saldo->bind(8, Variant(Decimal(20)), qty);
        else
            saldo->bindNull(8);
        saldo->step();

        if (n % 4 == 0) {
            discount->reset();
            discount->bindText(1, keys.next());
            discount->bindText(2, schema);
            discount->bindText(3, id);
            discount->bind(4, Variant(Decimal(5 * (1 + (n / 4) % 3))), pct);
            discount->step();
        }
    }

    auto set = db.prepare("UPDATE sys_settings SET Value = ?2 WHERE Name = ?1");
    set->bindText(1, "DefPriceList_ID");
    set->bindText(2, plTypes[0]);
    set->step();
}

}  // namespace pelta::bll

namespace pelta::bll {

namespace {

std::string scalarText(Database& db, const std::string& sql) {
    auto st = db.prepare(sql);
    if (!st->step() || st->isNull(0)) return {};
    return std::string(st->text(0));
}

}  // namespace

void generateDemoItemDetails(Database& db, uint64_t seed, bool priceTypes) {
    Keys keys(seed ^ 0xDE7A115ULL);
    const ColumnType guid = ColumnType::parse("GUID").value();
    const ColumnType price = ColumnType::parse("DECIMAL(18,8)").value();
    const ColumnType qty = ColumnType::parse("DECIMAL(18,6)").value();
    const ColumnType pct = ColumnType::parse("DECIMAL(9,4)").value();
    const ColumnType day = ColumnType::parse("DATE").value();
    const Variant admin(kAdminId);
    const Date stamp = makeDate(2024, 1, 1, 9, 0, 0);
    auto exec = [&](const std::string& sql, std::initializer_list<Variant> params) {
        auto st = db.prepare(sql);
        int i = 0;
        for (const Variant& p : params)
            st->bind(++i, p);
        st->step();
    };

    // Duty tariffs, Intrastat codes (one the default) and shelves.
    std::vector<std::string> tariffs;
    for (const auto& [code, name, percent] :
         {std::tuple{"0901", "Кафе, печено или непечено", 75},
          std::tuple{"2202", "Води и безалкохолни напитки", 96},
          std::tuple{"8544", "Изолирани проводници и кабели", 37}}) {
        tariffs.push_back(keys.next());
        auto st = db.prepare(
            "INSERT INTO nom_dutytariffs (ID, Code, Name, DutyTariffPrc, IsActive, CU, CD, LU, "
            "LD) VALUES (?1, ?2, ?3, ?4, 1, ?5, ?6, ?5, ?6)");
        st->bindText(1, tariffs.back());
        st->bindText(2, code);
        st->bindText(3, name);
        st->bind(4, Variant(Decimal(percent) / Decimal(10)), pct);
        st->bind(5, admin, guid);
        st->bind(6, Variant(stamp));
        st->step();
    }
    std::string defaultIntrastat;
    for (const auto& [code, name, isDefault] :
         {std::tuple{"09012100", "Кафе, печено, с кофеин", 1},
          std::tuple{"22021000", "Води, вкл. минерални и газирани, подсладени", 0},
          std::tuple{"85444993", "Проводници за напрежение не повече от 80 V", 0}}) {
        const std::string id = keys.next();
        if (isDefault) defaultIntrastat = id;
        exec(
            "INSERT INTO nom_intrastat (ID, Code, Name, IsDefault, IsActive) VALUES (?1, ?2, ?3, "
            "?4, 1)",
            {Variant(id), Variant(code), Variant(name), Variant(isDefault)});
    }
    const std::string central = scalarText(db, "SELECT ID FROM nom_stores WHERE Code = '1'");
    for (const auto& [code, name] :
         {std::pair{"A-01", "Стелаж A, ниво 1"}, std::pair{"A-02", "Стелаж A, ниво 2"},
          std::pair{"B-01", "Стелаж B, ниво 1"}})
        exec(
            "INSERT INTO nom_shelves (ID, Code, Name, Store_ID, IsActive) VALUES (?1, ?2, ?3, ?4, "
            "1)",
            {Variant(keys.next()), Variant(code), Variant(name),
             central.empty() ? Variant::null() : Variant(central)});

    // Directions: inner nodes and leaves.
    std::map<std::string, std::string> direction;
    for (const auto& [code, parent, name] :
         {std::tuple{"1", "", "Продажби"}, std::tuple{"11", "1", "Търговия на едро"},
          std::tuple{"12", "1", "Търговия на дребно"}, std::tuple{"121", "12", "Магазин"},
          std::tuple{"122", "12", "Онлайн магазин"}, std::tuple{"2", "", "Производство"},
          std::tuple{"21", "2", "Цех"}}) {
        direction[code] = keys.next();
        exec(
            "INSERT INTO nom_finstruct (ID, P_ID, Code, Name, IsActive) VALUES (?1, ?2, ?3, ?4, "
            "1)",
            {Variant(direction[code]), *parent ? Variant(direction.at(parent)) : Variant::null(),
             Variant(code), Variant(name)});
    }

    // Roundings.
    std::vector<std::string> rounds;
    for (const auto& [name, modulo, reminder, vatIncluded] :
         {std::tuple{"Без закръгляване", 0, 0, 0}, std::tuple{"Нагоре до 0.10", 10, 0, 0},
          std::tuple{"Цени .99 с ДДС", 100, 99, 1}}) {
        rounds.push_back(keys.next());
        exec(
            "INSERT INTO nom_roundtypes (ID, Name, Modulo, Reminder, Direction, IsVatIncluded, "
            "IsDefault, IsActive) VALUES (?1, ?2, ?3, ?4, 1, ?5, ?6, 1)",
            {Variant(rounds.back()), Variant(name), Variant(modulo), Variant(reminder),
             Variant(vatIncluded), Variant(rounds.size() == 1 ? 1 : 0)});
    }
    // With price types: the supplier price list, and a price list generated
    // from the default one: ten percent more, fifteen for drinks, in steps of
    // ten stotinki up.
    if (priceTypes) {
        const std::string retail =
            scalarText(db, "SELECT Value FROM sys_settings WHERE Name = 'DefPriceList_ID'");
        const std::string supplier = keys.next(), online = keys.next();
        auto type = db.prepare(
            "INSERT INTO nom_pricelisttypes (ID, Code, Name, IsPromo, IsActive, IsAutoGener, "
            "PriceFormType, ParentPlType_ID, RoundType_ID, CU, CD, LU, LD) "
            "VALUES (?1, ?2, ?3, 0, 1, ?4, ?5, ?6, ?7, ?8, ?9, ?8, ?9)");
        for (const auto& [id, code, name, generated] :
             {std::tuple{supplier, "S", "Доставни цени", 0},
              std::tuple{online, "4", "Онлайн", 1}}) {
            type->reset();
            type->bindText(1, id);
            type->bindText(2, code);
            type->bindText(3, name);
            type->bindInt64(4, generated);
            type->bindInt64(5, generated ? 3 : 1);
            if (generated && !retail.empty())
                type->bindText(6, retail);
            else
                type->bindNull(6);
            if (generated)
                type->bindText(7, rounds[1]);
            else
                type->bindNull(7);
            type->bind(8, admin, guid);
            type->bind(9, Variant(stamp));
            type->step();
        }
        exec("UPDATE sys_settings SET Value = ?1 WHERE Name = 'SupplPriceList_ID'",
             {Variant(supplier)});
        auto markup = db.prepare(
            "INSERT INTO nom_pricelistdimvalues (ID, PriceListType_ID, ListValue_ID, CoefficientA, "
            "CoefficientB, IsActive) VALUES (?1, ?2, ?3, ?4, 0, 1)");
        const std::string drinks =
            scalarText(db, "SELECT ID FROM nom_dimvalues WHERE Name = 'Напитки'");
        for (const auto& [value, percent] : {std::pair{std::string(), 10}, std::pair{drinks, 15}}) {
            if (percent == 15 && value.empty()) continue;
            markup->reset();
            markup->bindText(1, keys.next());
            markup->bindText(2, online);
            if (value.empty())
                markup->bindNull(3);
            else
                markup->bindText(3, value);
            markup->bind(4, Variant(Decimal(percent)), price);
            markup->step();
        }
    }

    // The last items: attributes, lots and bills of materials.
    struct First {
        std::string id, measure, type;
    };
    std::vector<First> first;
    {
        auto st = db.prepare(
            "SELECT i.ID, i.Measure_ID, t.Name FROM nom_items i JOIN nom_itemtypes t ON t.ID = "
            "i.ItmType_ID ORDER BY i.Code DESC LIMIT 12");
        while (st->step())
            first.push_back(
                {std::string(st->text(0)), std::string(st->text(1)), std::string(st->text(2))});
    }
    auto attrs = db.prepare(
        "UPDATE nom_items SET Intrastat_ID = ?2, DutyTariff_id = ?3, FinStruct_ID = ?4, "
        "WarrantyPeriod = 24, LifePeriod = ?5 WHERE ID = ?1");
    auto lot = db.prepare(
        "INSERT INTO nom_itemlots (ID, Itm_ID, Store_ID, Lot, VendorLot, ExpiryDate, DeliveryDate, "
        "OriginCountryName, Quantity, PriceAvg, PriceAvgPrev) "
        "VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8, ?9, ?10, ?11)");
    const char* countries[] = {"България", "Италия", "Германия"};
    for (size_t n = 0; n < first.size(); ++n) {
        attrs->reset();
        attrs->bindText(1, first[n].id);
        attrs->bindText(2, defaultIntrastat);
        attrs->bindText(3, tariffs[n % tariffs.size()]);
        attrs->bindText(4, direction.at(n % 2 ? "121" : "11"));
        attrs->bindInt64(5, 6 + static_cast<int64_t>(n % 3) * 6);
        attrs->step();
        if (n >= 6 || central.empty()) continue;
        for (int k = 0; k < 2; ++k) {
            const int64_t cents = 100 + static_cast<int64_t>(keys.number(5000));
            lot->reset();
            lot->bindText(1, keys.next());
            lot->bindText(2, first[n].id);
            lot->bindText(3, central);
            lot->bindText(4, "L" + digits(n + 1, 3) + "-" + std::to_string(k + 1));
            lot->bindText(5, "V-" + digits(keys.number(100000), 5));
            lot->bind(6, Variant(makeDate(2025, 3 + k * 6, 1 + static_cast<int>(n))), day);
            lot->bind(7, Variant(makeDate(2024, 1 + k, 10 + static_cast<int>(n))), day);
            lot->bindText(8, countries[(n + static_cast<size_t>(k)) % std::size(countries)]);
            lot->bind(9, Variant(Decimal(static_cast<int64_t>(5 + keys.number(40)))), qty);
            lot->bind(10, money(cents), price);
            if (k == 0)
                lot->bindNull(11);
            else
                lot->bind(11, money(cents - 7), price);
            lot->step();
        }
    }
    // Two products made of the other items among them.
    std::vector<const First*> products, parts;
    for (const First& f : first)
        (f.type == "Продукт" && products.size() < 2 ? products : parts).push_back(&f);
    auto bom = db.prepare(
        "INSERT INTO nom_boms (ID, Itm_ID, Name, IsActive, IsDefault, Quantity, CU, CD, LU, LD) "
        "VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8, ?7, ?8)");
    auto row = db.prepare(
        "INSERT INTO nom_bomsdetails (ID, Bom_ID, Itm_ID, RowNo, Measure_ID, Quantity, CU, CD, "
        "LU, LD) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8, ?7, ?8)");
    const char* amounts[] = {"0.5", "2", "0.25", "1.125"};
    for (size_t p = 0; p < products.size() && parts.size() >= 3; ++p) {
        for (int b = 0; b < (p == 0 ? 2 : 1); ++b) {
            const std::string id = keys.next();
            bom->reset();
            bom->bindText(1, id);
            bom->bindText(2, products[p]->id);
            bom->bindText(3, b == 0 ? "Основна рецепта" : "Алтернативна рецепта");
            bom->bindInt64(4, b == 0 ? 1 : 0);
            bom->bindInt64(5, b == 0 ? 1 : 0);
            bom->bind(6, Variant(Decimal(b == 0 ? 1 : 10)), qty);
            bom->bind(7, admin, guid);
            bom->bind(8, Variant(stamp));
            bom->step();
            for (int r = 0; r < 3; ++r) {
                const First& part = *parts[(p + static_cast<size_t>(b + r)) % parts.size()];
                row->reset();
                row->bindText(1, keys.next());
                row->bindText(2, id);
                row->bindText(3, part.id);
                row->bindInt64(4, r + 1);
                row->bindText(5, part.measure);
                row->bind(6, Variant(*Decimal::parse(amounts[(p + static_cast<size_t>(r)) % 4])),
                          qty);
                row->bind(7, admin, guid);
                row->bind(8, Variant(stamp));
                row->step();
            }
        }
        recalcBomPrices(db, products[p]->id, kAdminId, stamp);
        exec(
            "UPDATE nom_items SET BomCount = (SELECT COUNT(*) FROM nom_boms WHERE Itm_ID = ?1) "
            "WHERE ID = ?1",
            {Variant(products[p]->id)});
    }
}

}  // namespace pelta::bll
