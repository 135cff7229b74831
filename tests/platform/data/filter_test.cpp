// Filter criteria: the grammar, each operator on each kind of field, case
// folding of text, LIKE patterns and malformed criteria.
#include <gtest/gtest.h>

#include "platform/automation/error.h"
#include "platform/data/recordset.h"

using namespace pelta;

namespace {

struct Row {
    int32_t id;
    const char* name;
    const char* price;  // nullptr: Null
    int32_t qty;
    bool active;
    Date date;
    const char* guid;
    const char* note;  // nullptr: Null
};

Ref<Recordset> data() {
    auto rs = makeRef<Recordset>();
    rs->appendField("ID", FieldType::Long);
    rs->appendField("Name", FieldType::Text, 40);
    rs->appendDecimalField("Price", 19, 4);
    rs->appendField("Qty", FieldType::Double);
    rs->appendField("IsActive", FieldType::Boolean);
    rs->appendField("CD", FieldType::Date);
    rs->appendField("Key", FieldType::Guid);
    rs->appendField("Note", FieldType::LongText);
    rs->appendField("Sum", FieldType::Currency);
    rs->appendField("Item Name", FieldType::Text, 40);
    rs->open();
    const Row rows[] = {
        {1, "Иван Петров", "10.5", 3, true, makeDate(2024, 1, 31),
         "{00000000-0000-0000-0000-000000000001}", "O'Brien"},
        {2, "иван", "2", 0, false, makeDate(2024, 2, 1, 12),
         "{00000000-0000-0000-0000-000000000002}", nullptr},
        {3, "IVAN", nullptr, -1, true, makeDate(2023, 12, 31),
         "{00000000-0000-0000-0000-000000000003}", "note"},
        {4, "Mария", "10.50", 7, true, makeDate(2024, 1, 31, 8),
         "{00000000-0000-0000-0000-000000000004}", "*star*"},
        {5, "abc-xyz", "100", 2, false, makeDate(2024, 3, 1),
         "{00000000-0000-0000-0000-000000000005}", "50%"},
    };
    for (const Row& r : rows) {
        rs->addNew();
        rs->setValue("ID", r.id);
        rs->setValue("Name", r.name);
        rs->setValue("Price", r.price ? Variant(*Decimal::parse(r.price)) : Variant::null());
        rs->setValue("Qty", r.qty);
        rs->setValue("IsActive", r.active);
        rs->setValue("CD", r.date);
        rs->setValue("Key", r.guid);
        rs->setValue("Note", r.note ? Variant(r.note) : Variant::null());
        rs->setValue("Sum", Variant(Currency{r.id * 10001}));  // 1.0001 * id
        rs->setValue("Item Name", std::string("Item ") + std::to_string(r.id));
        rs->update();
    }
    return rs;
}

std::vector<int32_t> matching(Recordset& rs, std::string_view criteria) {
    rs.setFilter(criteria);
    std::vector<int32_t> out;
    for (; !rs.eof(); rs.moveNext())
        out.push_back(rs.value("ID").toLong());
    return out;
}

using Ids = std::vector<int32_t>;

}  // namespace

TEST(Filter, ComparisonOperatorsOnNumbers) {
    auto rs = data();
    EXPECT_EQ(matching(*rs, "ID = 2"), Ids({2}));
    EXPECT_EQ(matching(*rs, "ID <> 2"), Ids({1, 3, 4, 5}));
    EXPECT_EQ(matching(*rs, "ID < 2"), Ids({1}));
    EXPECT_EQ(matching(*rs, "ID > 4"), Ids({5}));
    EXPECT_EQ(matching(*rs, "ID <= 2"), Ids({1, 2}));
    EXPECT_EQ(matching(*rs, "ID >= 4"), Ids({4, 5}));
    EXPECT_EQ(matching(*rs, "Qty < 0"), Ids({3}));
    EXPECT_EQ(matching(*rs, "Qty >= 2.5"), Ids({1, 4}));
    EXPECT_EQ(matching(*rs, "ID = '3'"), Ids({3}));
    EXPECT_EQ(matching(*rs, "Qty > -1e0"), Ids({1, 2, 4, 5}));
}

TEST(Filter, DecimalCurrencyBooleanDateGuid) {
    auto rs = data();
    EXPECT_EQ(matching(*rs, "Price = 10.5"), Ids({1, 4}));  // 10.50 equals 10.5
    EXPECT_EQ(matching(*rs, "Price > 10.49999"), Ids({1, 4, 5}));
    EXPECT_EQ(matching(*rs, "Price < 3"), Ids({2}));  // Null never compares
    EXPECT_EQ(matching(*rs, "Sum = 2.0002"), Ids({2}));
    EXPECT_EQ(matching(*rs, "Sum > 2.00015"), Ids({2, 3, 4, 5}));
    EXPECT_EQ(matching(*rs, "Sum < 2.00025"), Ids({1, 2}));
    EXPECT_EQ(matching(*rs, "Sum <= -1.00005"), Ids({}));
    EXPECT_EQ(matching(*rs, "Sum < 99999999999999999999"), Ids({1, 2, 3, 4, 5}));
    EXPECT_EQ(matching(*rs, "IsActive = True"), Ids({1, 3, 4}));
    EXPECT_EQ(matching(*rs, "IsActive = false"), Ids({2, 5}));
    EXPECT_EQ(matching(*rs, "IsActive <> 0"), Ids({1, 3, 4}));
    EXPECT_EQ(matching(*rs, "CD = #2024-01-31#"), Ids({1}));
    EXPECT_EQ(matching(*rs, "CD >= #1/31/2024# AND CD < #2/1/2024#"), Ids({1, 4}));
    EXPECT_EQ(matching(*rs, "CD > '31.01.2024 07:59'"), Ids({2, 4, 5}));
    EXPECT_EQ(matching(*rs, "CD = #2/1/2024 12:00 PM#"), Ids({2}));
    EXPECT_EQ(matching(*rs, "Key = {00000000-0000-0000-0000-000000000003}"), Ids({3}));
    EXPECT_EQ(matching(*rs, "Key = '{00000000-0000-0000-0000-000000000004}'"), Ids({4}));
}

TEST(Filter, TextIgnoresCaseIncludingCyrillic) {
    auto rs = data();
    EXPECT_EQ(matching(*rs, "Name = 'ИВАН'"), Ids({2}));
    EXPECT_EQ(matching(*rs, "Name = 'ivan'"), Ids({3}));
    EXPECT_EQ(matching(*rs, "Name LIKE 'иВаН*'"), Ids({1, 2}));
    EXPECT_EQ(matching(*rs, "Name LIKE '*ПЕТРОВ'"), Ids({1}));
    EXPECT_EQ(matching(*rs, "Name LIKE '%ари%'"), Ids({4}));
    EXPECT_EQ(matching(*rs, "Name LIKE '*B*'"), Ids({5}));
    EXPECT_EQ(matching(*rs, "Name LIKE 'ABC*'"), Ids({5}));
    EXPECT_EQ(matching(*rs, "Name LIKE '*XYZ'"), Ids({5}));
    EXPECT_EQ(matching(*rs, "Name LIKE 'abc-xyz'"), Ids({5}));
    EXPECT_EQ(matching(*rs, "Name LIKE '*'"), Ids({1, 2, 3, 4, 5}));
    EXPECT_EQ(matching(*rs, "Name LIKE 'm*'"), Ids({4}));  // Latin M then Cyrillic
    EXPECT_EQ(matching(*rs, "Name > 'и'"), Ids({1, 2}));
    EXPECT_EQ(matching(*rs, "Name < 'B'"), Ids({5}));
    EXPECT_EQ(matching(*rs, "Name <> 'иван'"), Ids({1, 3, 4, 5}));
    EXPECT_EQ(matching(*rs, "[Item Name] = 'ITEM 3'"), Ids({3}));
}

TEST(Filter, CharactersThatFoldToAscii) {
    auto rs = makeRef<Recordset>();
    rs->appendField("ID", FieldType::Long);
    rs->appendField("T", FieldType::Text);
    rs->open();
    // U+212A KELVIN SIGN folds to 'k'; U+017F LONG S folds to 's'.
    const char* texts[] = {"\u212Aey", "ke\u017F", "KEY", "kex", "\u017F"};
    int32_t id = 0;
    for (const char* t : texts) {
        rs->addNew();
        rs->setValue("ID", ++id);
        rs->setValue("T", t);
    }
    rs->update();
    EXPECT_EQ(matching(*rs, "T = 'key'"), Ids({1, 3}));
    EXPECT_EQ(matching(*rs, "T LIKE 'k*'"), Ids({1, 2, 3, 4}));
    EXPECT_EQ(matching(*rs, "T LIKE '*s'"), Ids({2, 5}));
    EXPECT_EQ(matching(*rs, "T LIKE '*es*'"), Ids({2}));
    EXPECT_EQ(matching(*rs, "T = 'S'"), Ids({5}));
}

TEST(Filter, NullsAndQuotes) {
    auto rs = data();
    EXPECT_EQ(matching(*rs, "Note = NULL"), Ids({2}));
    EXPECT_EQ(matching(*rs, "Note <> Null"), Ids({1, 3, 4, 5}));
    EXPECT_EQ(matching(*rs, "Price IS NULL"), Ids({3}));
    EXPECT_EQ(matching(*rs, "Price is not null"), Ids({1, 2, 4, 5}));
    EXPECT_EQ(matching(*rs, "Note = 'o''brien'"), Ids({1}));
    EXPECT_EQ(matching(*rs, "Note <> 'note'"), Ids({1, 4, 5}));  // Null is not <> either
    EXPECT_EQ(matching(*rs, "Note = '*star*'"), Ids({4}));       // '=' has no wildcards
}

TEST(Filter, AndBindsTighterThanOrAndParenthesesRegroup) {
    auto rs = data();
    EXPECT_EQ(matching(*rs, "ID = 1 OR ID = 2 AND IsActive = True"), Ids({1}));
    EXPECT_EQ(matching(*rs, "IsActive = True AND ID = 2 OR ID = 5"), Ids({5}));
    EXPECT_EQ(matching(*rs, "(ID = 1 OR ID = 2) AND IsActive = False"), Ids({2}));
    EXPECT_EQ(matching(*rs, "((ID = 1) OR (ID = 5 AND (Qty = 2 OR Qty = 3)))"), Ids({1, 5}));
    EXPECT_EQ(matching(*rs, "ID > 1 AND ID < 5 AND Qty >= 0 OR Name LIKE 'abc*'"), Ids({2, 4, 5}));
}

TEST(Filter, SettingAFilterPutsTheCursorOnTheFirstVisibleRow) {
    auto rs = data();
    rs->moveLast();
    rs->setFilter("ID > 2");
    EXPECT_EQ(rs->absolutePosition(), 1);
    EXPECT_EQ(rs->value("ID").toLong(), 3);
    EXPECT_EQ(rs->recordCount(), 3);
    EXPECT_EQ(rs->filter(), Variant("ID > 2"));
    rs->setFilter("ID > 100");
    EXPECT_TRUE(rs->bof() && rs->eof());
    rs->setFilter(Variant());
    EXPECT_EQ(rs->recordCount(), 5);
    rs->setFilter("   ");
    EXPECT_EQ(rs->recordCount(), 5);
}

TEST(Filter, PendingFilterShowsChangedRows) {
    auto rs = data();
    rs->updateBatch();
    rs->setFilter(Variant(int32_t{1}));
    EXPECT_EQ(rs->recordCount(), 0);
    rs->clearFilter();
    rs->setAbsolutePosition(2);
    rs->setValue("Qty", 5);
    rs->update();
    rs->setAbsolutePosition(4);
    rs->deleteRecord();
    rs->setFilter(FilterGroup::Pending);
    EXPECT_EQ(rs->recordCount(), 2);
    EXPECT_EQ(rs->value("ID").toLong(), 2);
}

namespace {
// The error a criteria raises: number and the position it names.
std::pair<int32_t, std::string> failure(Recordset& rs, std::string_view criteria) {
    try {
        rs.setFilter(criteria);
    } catch (const Error& e) {
        auto p = e.description().find("position ");
        std::string pos;
        if (p != std::string::npos)
            for (size_t i = p + 9; i < e.description().size() && isdigit(e.description()[i]); ++i)
                pos.push_back(e.description()[i]);
        return {e.number(), pos};
    }
    return {0, ""};
}
}  // namespace

TEST(Filter, MalformedCriteriaNameThePosition) {
    auto rs = data();
    struct Case {
        const char* criteria;
        const char* position;
    };
    const Case cases[] = {
        {"Name = 'abc", "8"},              // unterminated text
        {"Nmae = 1", "1"},                 // unknown field
        {"ID = 1 AND", "11"},              // nothing after AND
        {"ID = 1 ID = 2", "8"},            // missing AND/OR
        {"(ID = 1", "8"},                  // missing ')'
        {"ID = 1)", "7"},                  // stray ')'
        {"ID == 1", "5"},                  // a second '='
        {"ID ! 1", "4"},                   // unknown operator
        {"ID = 'x'", "6"},                 // not a number
        {"ID LIKE '1*'", "4"},             // LIKE on a number
        {"Name LIKE 'a*b'", "11"},         // wildcard inside
        {"CD = #2024-13-01#", "6"},        // no month 13
        {"CD = #2024-01-01", "6"},         // unterminated date
        {"Key = {1234}", "7"},             // not a GUID
        {"Name = 'я' AND Имя = 1", "16"},  // characters, not bytes
        {"Price > NULL", "9"},             // NULL only with = and <>
        {"[Name = 'x'", "1"},              // unterminated bracket
        {"ID = 12abc", "8"},               // junk after a number
        {"ID = ", "6"},                    // missing value
        {"ID = @", "6"},                   // unexpected character
        {"", ""},                          // (empty clears: no error)
    };
    for (const Case& c : cases) {
        auto [number, pos] = failure(*rs, c.criteria);
        if (!*c.criteria) {
            EXPECT_EQ(number, 0);
            continue;
        }
        EXPECT_EQ(number, rserr::InvalidArgument) << c.criteria;
        EXPECT_EQ(pos, c.position) << c.criteria;
    }
    // A failed filter leaves the previous one in force.
    rs->setFilter("ID = 2");
    EXPECT_NE(failure(*rs, "ID = ").first, 0);
    EXPECT_EQ(rs->recordCount(), 1);
}

TEST(Filter, BracketsMakeWildcardsLiteralInLike) {
    auto rs = data();
    // Notes: "O'Brien", Null, "note", "*star*", "50%".
    EXPECT_EQ(matching(*rs, "Note LIKE '*[*]*'"), Ids({4}));
    EXPECT_EQ(matching(*rs, "Note LIKE '[*]star[*]'"), Ids({4}));
    EXPECT_EQ(matching(*rs, "Note LIKE '*0[%]'"), Ids({5}));
    EXPECT_EQ(matching(*rs, "Note LIKE '*[%]*'"), Ids({5}));
    EXPECT_EQ(matching(*rs, "Note LIKE 'o''b*'"), Ids({1}));
    // A wildcard escaped in the middle is allowed; a bracket not closing one
    // character is itself.
    EXPECT_EQ(matching(*rs, "Note LIKE '*t[a]r*'"), Ids({4}));
    EXPECT_EQ(matching(*rs, "Note LIKE '*[st*'"), Ids({}));
    EXPECT_EQ(matching(*rs, "Name LIKE '[и]ван*'"), Ids({1, 2}));
    EXPECT_EQ(failure(*rs, "Note LIKE '*[*]a*b'").first, rserr::InvalidArgument);
}

TEST(Filter, DeepNestingIsRefusedNotOverflowed) {
    auto rs = data();
    std::string deep(100000, '(');
    EXPECT_EQ(failure(*rs, deep).first, rserr::InvalidArgument);
    std::string ok = std::string(50, '(') + "ID = 1" + std::string(50, ')');
    EXPECT_EQ(matching(*rs, ok), Ids({1}));
    std::string wide = "ID = 0";
    for (int i = 0; i < 20000; ++i)
        wide += " OR ID = 5";
    EXPECT_EQ(matching(*rs, wide), Ids({5}));
}
