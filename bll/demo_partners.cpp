// Demo business partners: types, dimensions with values, and partners with
// valid identification numbers, persons, delivery addresses, bank accounts
// and dimension values. Deterministic like the rest of the demo.
#include "bll/demo_partners.h"

#include <random>

#include "bll/database.h"
#include "bll/service.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr const char* kAdminId = "{0B9E3D5A-1C2F-4A6B-8D7E-3F5A9C1B2E40}";

class Sequence {
public:
    explicit Sequence(uint64_t seed) : rng_(seed ^ 0x9E3779B97F4A7C15ull) {}
    std::string key() {
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
    int below(int n) { return static_cast<int>(rng_() % static_cast<uint64_t>(n)); }
    std::string digits(int n) {
        std::string s;
        for (int i = 0; i < n; ++i)
            s.push_back(static_cast<char>('0' + below(10)));
        return s;
    }

private:
    std::mt19937_64 rng_;
};

// A company registry number of nine digits with its check digit.
std::string companyNumber(Sequence& seq) {
    std::string d = seq.digits(8);
    int a = 0, b = 0;
    for (int i = 0; i < 8; ++i) {
        a += (d[i] - '0') * (i + 1);
        b += (d[i] - '0') * (i + 3);
    }
    int check = a % 11;
    if (check == 10) check = (b % 11) % 10;
    return d + static_cast<char>('0' + check);
}

// A personal number: birth date, a serial and the check digit.
std::string personalNumber(Sequence& seq) {
    auto two = [](int v) {
        return std::string(1, static_cast<char>('0' + v / 10)) + static_cast<char>('0' + v % 10);
    };
    // Drawn one by one: the order of the draws is part of the demo.
    const int year = 50 + seq.below(50);
    const int month = 1 + seq.below(12);
    const int day = 1 + seq.below(28);
    const int serial = seq.below(1000);
    const std::string head =
        two(year) + two(month) + two(day) + two(serial / 10) + static_cast<char>('0' + serial % 10);
    static const int kWeights[] = {2, 4, 8, 5, 10, 9, 7, 3, 6};
    int sum = 0;
    for (int i = 0; i < 9; ++i)
        sum += (head[i] - '0') * kWeights[i];
    return head + static_cast<char>('0' + (sum % 11) % 10);
}

// A Bulgarian IBAN with valid check digits.
std::string iban(Sequence& seq) {
    const std::string bban = "UNCR7000" + seq.digits(10);
    std::string moved = bban + "BG00", numeric;
    for (char c : moved)
        numeric += (c >= 'A' && c <= 'Z') ? std::to_string(c - 'A' + 10) : std::string(1, c);
    int mod = 0;
    for (char c : numeric)
        mod = (mod * 10 + (c - '0')) % 97;
    const int check = 98 - mod;
    return "BG" + std::string(check < 10 ? "0" : "") + std::to_string(check) + bban;
}

constexpr const char* kFirst[] = {"Алфа", "Бета",  "Гама",  "Делта", "Омега", "Сигма",
                                  "Вега", "Орион", "Север", "Юг",    "Изток", "Запад"};
constexpr const char* kSecond[] = {"Трейд", "Строй", "Логистик", "Фарма",
                                   "Агро",  "Текс",  "Инвест",   "Маркет"};
constexpr const char* kForm[] = {"ЕООД", "ООД", "АД", "ЕТ"};
constexpr const char* kGiven[] = {"Иван",    "Петър",   "Георги", "Мария",  "Елена",
                                  "Димитър", "Николай", "Анна",   "Стефан", "Весела"};
constexpr const char* kFamily[] = {"Петров",  "Иванов",  "Георгиев", "Димитров",
                                   "Николов", "Стоянов", "Тодоров",  "Христов"};
constexpr const char* kCities[] = {"София", "Пловдив", "Варна", "Бургас", "Русе"};
constexpr const char* kStreets[] = {"Витоша", "Шипка", "Раковски", "Левски", "Христо Ботев"};

std::string familyFor(const char* family, const char* given) {
    // A woman's family name ends in "а".
    const std::string g = given;
    const bool woman = g == "Мария" || g == "Елена" || g == "Анна" || g == "Весела";
    return std::string(family) + (woman ? "а" : "");
}

}  // namespace

void generatePartnersDemo(Database& db, const DemoOptions& o) {
    Sequence seq(o.seed);
    const ColumnType guid = ColumnType::parse("GUID").value();
    const Date stamp = makeDate(2024, 1, 1, 9, 0, 0);
    const Variant admin(kAdminId);

    auto exec = [&](const std::string& sql, std::initializer_list<Variant> params) {
        auto st = db.prepare(sql);
        int i = 0;
        for (const Variant& p : params)
            st->bind(++i, p);
        st->step();
    };

    // Types: the default one first.
    struct Type {
        const char* code;
        const char* name;
        bool isDef;
        std::string id;
    };
    Type types[] = {{"CL", "Клиенти", true, {}},
                    {"SU", "Доставчици", false, {}},
                    {"ST", "Обекти", false, {}},
                    {"NP", "Физически лица", false, {}},
                    {"EM", "Служители", false, {}}};
    for (Type& t : types) {
        t.id = seq.key();
        exec("INSERT INTO nom_cgtypes (ID, Code, Name, IsDef, IsActive) VALUES (?1, ?2, ?3, ?4, 1)",
             {Variant(t.id), Variant(t.code), Variant(t.name), Variant(t.isDef)});
    }
    enum { kClient, kSupplier, kStore, kNatural, kEmployee };

    // Dimensions: a region (one value) and groups (several values).
    const std::string region = seq.key(), groups = seq.key();
    exec(
        "INSERT INTO nom_cgdimensions (ID, Code, Name, ValueType, IsRequired) VALUES "
        "(?1, 'REG', 'Регион', 1, 0)",
        {Variant(region)});
    exec(
        "INSERT INTO nom_cgdimensions (ID, Code, Name, ValueType, IsRequired) VALUES "
        "(?1, 'GRP', 'Групи', 7, 0)",
        {Variant(groups)});
    std::vector<std::string> regionValues, groupValues;
    for (const char* city : kCities) {
        regionValues.push_back(seq.key());
        exec("INSERT INTO nom_cgdimvalues (ID, Dimension_ID, Name) VALUES (?1, ?2, ?3)",
             {Variant(regionValues.back()), Variant(region), Variant(city)});
    }
    for (const char* g : {"Търговци на едро", "Търговци на дребно", "Ключови клиенти"}) {
        groupValues.push_back(seq.key());
        exec("INSERT INTO nom_cgdimvalues (ID, Dimension_ID, Name) VALUES (?1, ?2, ?3)",
             {Variant(groupValues.back()), Variant(groups), Variant(g)});
    }

    auto partner = db.prepare(
        "INSERT INTO nom_contragents (ID, Code, Name, Address, IsActive, TaxNo, Bulstat, "
        "CgType_ID, Phone, Email, PostalCode, PosCards, CreditLimitation, CU, CD, LU, LD) "
        "VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8, ?9, ?10, ?11, ?12, ?13, ?14, ?15, ?14, ?15)");
    auto person = db.prepare(
        "INSERT INTO nom_cgpersons (ID, Cg_ID, Name, Egn, IsActive, IsMol, IsOsp, IsDefMol, "
        "IsDefOsp, IsContact, PhoneMobile, Email, CU, CD, LU, LD) "
        "VALUES (?1, ?2, ?3, ?4, 1, 1, 1, 1, 1, 1, ?5, ?6, ?7, ?8, ?7, ?8)");
    auto address = db.prepare(
        "INSERT INTO nom_cgaddresses (ID, Cg_ID, Name, IsDefault, PostalCode) "
        "VALUES (?1, ?2, ?3, 1, ?4)");
    auto account = db.prepare(
        "INSERT INTO nom_cgbankaccounts (ID, Cg_ID, Name, AccountCode, BankCode, CurrencyCode) "
        "VALUES (?1, ?2, ?3, ?4, 'UNCRBGSF', 'BGN')");
    auto link = db.prepare(
        "INSERT INTO nom_cgdimlinks (ID, Cg_ID, Dimension_ID, DimValue_ID) VALUES (?1, ?2, ?3, "
        "?4)");
    auto links = db.prepare(
        "UPDATE nom_contragents SET PrsOsp_ID = ?2, DeliveryAddress_ID = ?3 WHERE ID = ?1");

    const int count = std::max(0, o.partners);
    for (int i = 0; i < count; ++i) {
        const int kind = i % 20 == 19  ? kStore
                         : i % 10 == 8 ? kNatural
                         : i % 10 == 9 ? kEmployee
                         : i % 10 >= 6 ? kSupplier
                                       : kClient;
        const bool individual = kind == kNatural || kind == kEmployee;
        const char* given = kGiven[seq.below(10)];
        const char* family = kFamily[seq.below(8)];
        std::string name;
        if (individual) {
            name = std::string(given) + " " + familyFor(family, given);
        } else {
            const int combos = 12 * 8 * 4;
            const int n = i % combos;
            name = std::string(kFirst[n % 12]) + " " + kSecond[(n / 12) % 8] + " " +
                   kForm[(n / 96) % 4];
            if (kind == kStore)
                name = "Обект " + std::string(kCities[i % 5]) + " " + std::to_string(i);
        }
        if (i >= 12 * 8 * 4 || individual) name += " " + std::to_string(i + 1);
        const std::string id = seq.key();
        const std::string bulstat = individual ? personalNumber(seq) : companyNumber(seq);
        const std::string city = kCities[i % 5];
        const std::string addr = "гр. " + city + ", ул. " + kStreets[seq.below(5)] + " " +
                                 std::to_string(1 + seq.below(120));
        const std::string postal = std::to_string(1000 + 1000 * (i % 5) + seq.below(900));
        std::string cards;
        if (i % 7 == 3) cards = "\x7F" + seq.digits(8) + "\x7F" + seq.digits(8) + "\x7F";

        partner->reset();
        partner->bind(1, Variant(id), guid);
        partner->bindText(2, std::to_string(i + 1));
        partner->bindText(3, name);
        partner->bindText(4, addr);
        partner->bindInt64(5, i % 23 == 22 ? 0 : 1);
        if (individual)
            partner->bindNull(6);
        else
            partner->bindText(6, "BG" + bulstat);
        partner->bindText(7, bulstat);
        partner->bind(8, Variant(types[kind].id), guid);
        partner->bindText(9, "+359 2 " + seq.digits(7));
        partner->bindText(10, "office" + std::to_string(i + 1) + "@example.bg");
        partner->bindText(11, postal);
        if (cards.empty())
            partner->bindNull(12);
        else
            partner->bindText(12, cards);
        partner->bindInt64(13, kind == kClient ? 100000000ll * (1 + seq.below(50)) : 0);
        partner->bind(14, admin, guid);
        partner->bind(15, Variant(stamp));
        partner->step();

        std::string prs, adr = seq.key();
        if (kind != kStore) {
            prs = seq.key();
            std::string prsName = name;
            if (!individual) {
                const char* g = kGiven[seq.below(10)];
                const char* f = kFamily[seq.below(8)];
                prsName = std::string(g) + " " + familyFor(f, g);
            }
            person->reset();
            person->bind(1, Variant(prs), guid);
            person->bind(2, Variant(id), guid);
            person->bindText(3, prsName);
            person->bindText(4, individual ? bulstat : personalNumber(seq));
            person->bindText(5, "+359 88 " + seq.digits(7));
            person->bindText(6, "person" + std::to_string(i + 1) + "@example.bg");
            person->bind(7, admin, guid);
            person->bind(8, Variant(stamp));
            person->step();
        }
        address->reset();
        address->bind(1, Variant(adr), guid);
        address->bind(2, Variant(id), guid);
        address->bindText(3, addr);
        address->bindText(4, postal);
        address->step();
        if (!individual && i % 3 == 0) {
            account->reset();
            account->bind(1, Variant(seq.key()), guid);
            account->bind(2, Variant(id), guid);
            const std::string accountNo = iban(seq);
            account->bindText(3, "УниКредит " + accountNo.substr(accountNo.size() - 4) + " BGN");
            account->bindText(4, accountNo);
            account->step();
        }
        links->reset();
        links->bind(1, Variant(id), guid);
        if (prs.empty())
            links->bindNull(2);
        else
            links->bind(2, Variant(prs), guid);
        links->bind(3, Variant(adr), guid);
        links->step();

        auto addLink = [&](const std::string& dim, const std::string& value) {
            link->reset();
            link->bind(1, Variant(seq.key()), guid);
            link->bind(2, Variant(id), guid);
            link->bind(3, Variant(dim), guid);
            link->bind(4, Variant(value), guid);
            link->step();
        };
        addLink(region, regionValues[static_cast<size_t>(i % 5)]);
        if (i % 3 == 0) addLink(groups, groupValues[static_cast<size_t>(i % 2)]);
        if (i % 6 == 0) addLink(groups, groupValues[2]);
    }

    auto set = db.prepare("UPDATE sys_settings SET Value = ?2 WHERE Name = ?1");
    auto put = [&](const char* name, const std::string& value) {
        set->reset();
        set->bindText(1, name);
        set->bindText(2, value);
        set->step();
    };
    put("CgTypeNaturalPerson_ID", types[kNatural].id);
    put("CgTypeEmployee_ID", types[kEmployee].id);
    put("CgTypeStore_ID", types[kStore].id);
    put("DefCgDimension_ID", region);

    // Operators may open partners, as they may open currency rates.
    exec(
        "INSERT INTO sec_grouprights (Group_ID, Screen, Rights) "
        "SELECT ID, 'ctxContragents', ?1 FROM sec_groups WHERE Name = 'Operators'",
        {Variant(rights::OpenDetails)});
}

}  // namespace pelta::bll
