// The byte form of recordsets: round trips of values, nulls, row status and
// original values, and refusal of malformed bytes.
#include <gtest/gtest.h>

#include <random>

#include "platform/automation/error.h"
#include "platform/data/recordset.h"

using namespace pelta;

namespace {

Ref<Recordset> sample() {
    auto rs = makeRef<Recordset>();
    rs->appendField("ID", FieldType::Guid, 0, false);
    rs->appendField("Code", FieldType::Text, 20);
    rs->appendField("Name", FieldType::Text, 100);
    rs->appendDecimalField("Price", 19, 4);
    rs->appendField("Cur", FieldType::Currency);
    rs->appendField("IsActive", FieldType::Boolean);
    rs->appendField("Qty", FieldType::Double);
    rs->appendField("N", FieldType::Long);
    rs->appendField("CD", FieldType::Date);
    rs->appendField("Note", FieldType::LongText);
    rs->appendField("Pic", FieldType::Binary);
    rs->open();
    for (int i = 0; i < 6; ++i) {
        rs->addNew();
        char id[40];
        std::snprintf(id, sizeof id, "{00000000-0000-0000-0000-%012d}", i + 1);
        rs->setValue("ID", id);
        rs->setValue("Code", "C" + std::to_string(i));
        rs->setValue("Name", i % 2 ? Variant("Продукт " + std::to_string(i)) : Variant::null());
        rs->setValue("Price", Variant(*Decimal::parse("1234.5678")));
        rs->setValue("Cur", Variant(Currency{i * 12345}));
        rs->setValue("IsActive", i % 3 == 0);
        rs->setValue("Qty", i * 0.25);
        rs->setValue("N", -i);
        rs->setValue("CD", makeDate(2024, 5, i + 1));
        rs->setValue("Note", std::string(static_cast<size_t>(i) * 7, 'n'));
        rs->setValue("Pic", Bytes(static_cast<size_t>(i), static_cast<uint8_t>(i)));
    }
    rs->update();
    rs->updateBatch();
    // Pending changes: row 2 modified (twice, text grows and shrinks), row 4
    // deleted, one new row.
    rs->setAbsolutePosition(2);
    rs->setValue("Name", "Много по-дълго име от преди");
    rs->setValue("Price", Variant(Decimal(7)));
    rs->update();
    rs->setValue("Code", "X");
    rs->update();
    rs->setAbsolutePosition(4);
    rs->deleteRecord();
    rs->addNew();
    rs->setValue("ID", "{00000000-0000-0000-0000-000000000099}");
    rs->setValue("Code", "NEW");
    rs->update();
    return rs;
}

struct Snapshot {
    std::vector<std::vector<Variant>> values, originals;
    std::vector<RowStatus> status;
    friend bool operator==(const Snapshot&, const Snapshot&) = default;
};

// Every row, deleted ones included, through a pending-aware walk.
Snapshot snapshot(Recordset& rs) {
    Snapshot s;
    auto c = rs.clone();
    for (int pass = 0; pass < 2; ++pass) {
        c->setFilter(pass == 0 ? FilterGroup::None : FilterGroup::Pending);
        for (c->moveFirst(); !c->eof(); c->moveNext()) {
            if (pass == 1 && c->status() != RowStatus::Deleted) continue;
            std::vector<Variant> v, o;
            for (size_t f = 0; f < c->fieldCount(); ++f) {
                v.push_back(c->value(f));
                o.push_back(c->originalValue(f));
            }
            s.values.push_back(v);
            s.originals.push_back(o);
            s.status.push_back(c->status());
        }
    }
    return s;
}

int32_t loadError(std::span<const uint8_t> bytes) {
    try {
        Recordset::load(bytes);
    } catch (const Error& e) {
        return e.number();
    }
    return 0;
}

}  // namespace

TEST(RecordsetBytes, RoundTripKeepsShapeValuesStatusAndOriginals) {
    auto rs = sample();
    Bytes b = rs->save();
    auto back = Recordset::load(b);
    ASSERT_EQ(back->fieldCount(), rs->fieldCount());
    for (size_t f = 0; f < rs->fieldCount(); ++f) {
        EXPECT_EQ(back->fieldDef(f).name, rs->fieldDef(f).name);
        EXPECT_EQ(back->fieldDef(f).type, rs->fieldDef(f).type);
        EXPECT_EQ(back->fieldDef(f).definedSize, rs->fieldDef(f).definedSize);
        EXPECT_EQ(back->fieldDef(f).nullable, rs->fieldDef(f).nullable);
        EXPECT_EQ(back->fieldDef(f).precision, rs->fieldDef(f).precision);
        EXPECT_EQ(back->fieldDef(f).scale, rs->fieldDef(f).scale);
    }
    EXPECT_EQ(snapshot(*back), snapshot(*rs));
    EXPECT_EQ(back->recordCount(), 6);
    // The loaded pending changes can still be cancelled or accepted.
    back->cancelBatch();
    back->moveFirst();
    back->move(1);
    EXPECT_EQ(back->value("Code").str(), "C1");
    EXPECT_EQ(back->value("Price").toString(), "1234.5678");
    EXPECT_EQ(back->recordCount(), 6);
    // Saving again gives the same bytes.
    EXPECT_EQ(Recordset::load(b)->save(), b);
}

TEST(RecordsetBytes, AcceptedChangesAndRemovedRowsAreNotSaved) {
    auto rs = sample();
    rs->updateBatch();
    auto back = Recordset::load(rs->save());
    EXPECT_EQ(back->recordCount(), 6);
    back->setFilter(FilterGroup::Pending);
    EXPECT_EQ(back->recordCount(), 0);
    back->clearFilter();
    back->setAbsolutePosition(2);
    EXPECT_EQ(back->value("Name").str(), "Много по-дълго име от преди");
    EXPECT_EQ(back->originalValue("Name").str(), "Много по-дълго име от преди");
}

TEST(RecordsetBytes, FilteredRecordsetSavesItsVisibleRows) {
    auto rs = sample();
    rs->setFilter(FilterGroup::Pending);
    auto pending = Recordset::load(rs->save());
    EXPECT_EQ(pending->recordCount(), 2);  // modified and new; the deleted one hides
    pending->setFilter(FilterGroup::Pending);
    EXPECT_EQ(pending->recordCount(), 3);
    rs->setFilter("Code LIKE 'C*' AND IsActive = True");
    auto some = Recordset::load(rs->save());
    EXPECT_EQ(some->recordCount(), 1);
    EXPECT_EQ(some->value("Code").str(), "C0");
}

TEST(RecordsetBytes, EmptyAndFieldlessRecordsets) {
    auto empty = makeRef<Recordset>();
    empty->appendField("A", FieldType::Text, 5);
    empty->open();
    auto back = Recordset::load(empty->save());
    EXPECT_EQ(back->recordCount(), 0);
    EXPECT_EQ(back->fieldDef(0).definedSize, 5u);

    auto none = makeRef<Recordset>();
    none->open();
    EXPECT_EQ(Recordset::load(none->save())->fieldCount(), 0u);
}

TEST(RecordsetBytes, EveryTruncationRaises) {
    Bytes b = sample()->save();
    for (size_t n = 0; n < b.size(); ++n)
        EXPECT_EQ(loadError(std::span(b.data(), n)), errc::InvalidData) << "length " << n;
    Bytes longer = b;
    longer.push_back(0);
    EXPECT_EQ(loadError(longer), errc::InvalidData);
}

TEST(RecordsetBytes, CorruptionIsRefusedClearly) {
    Bytes good = sample()->save();
    auto patched = [&](size_t at, uint8_t v) {
        Bytes b = good;
        b[at] = v;
        return b;
    };
    EXPECT_EQ(loadError(patched(0, 'X')), errc::InvalidData);  // magic
    EXPECT_EQ(loadError(patched(4, 2)), errc::InvalidData);    // version
    try {
        Recordset::load(patched(4, 7));
        FAIL();
    } catch (const Error& e) {
        EXPECT_NE(e.description().find("version 7"), std::string::npos) << e.description();
    }
    // A huge field count must not be believed.
    Bytes huge = {'P', 'L', 'R', 'S', 1, 0, 0, 0, 0xFF, 0xFF, 0xFF, 0xFF, 0x0F};
    EXPECT_EQ(loadError(huge), errc::InvalidData);
    // A duplicate field name.
    auto two = makeRef<Recordset>();
    two->appendField("AB", FieldType::Long);
    two->appendField("XY", FieldType::Long);
    two->open();
    Bytes dup = two->save();
    auto pos = std::search(dup.begin(), dup.end(), std::begin("XY"), std::begin("XY") + 2);
    pos[0] = 'a', pos[1] = 'b';
    EXPECT_EQ(loadError(dup), errc::InvalidData);

    // Random damage either loads or raises InvalidData, never anything else.
    std::mt19937 rng(7);
    for (int i = 0; i < 3000; ++i) {
        Bytes b = good;
        for (int k = 0; k < 3; ++k)
            b[rng() % b.size()] = static_cast<uint8_t>(rng());
        int32_t e = loadError(b);
        EXPECT_TRUE(e == 0 || e == errc::InvalidData) << e;
    }
}

TEST(RecordsetBytes, TextSpansOutsideTheArenaAreRefused) {
    auto rs = makeRef<Recordset>();
    rs->appendField("T", FieldType::Text);
    rs->open();
    rs->addNew();
    rs->setValue("T", "abc");
    rs->update();
    Bytes b = rs->save();
    // Layout tail: ... arena size(1) "abc" offset(4) length(4) originals(1).
    ASSERT_GE(b.size(), 10u);
    size_t lengthAt = b.size() - 1 - 4;
    b[lengthAt] = 4;
    EXPECT_EQ(loadError(b), errc::InvalidData);
    b[lengthAt] = 3;
    b[lengthAt - 4] = 1;  // offset 1, length 3: past the end
    EXPECT_EQ(loadError(b), errc::InvalidData);
    b[lengthAt - 4] = 0;
    EXPECT_EQ(Recordset::load(b)->value("T").str(), "abc");
}

TEST(RecordsetBytes, NestsThroughThePersistHook) {
    auto rs = sample();
    PersistLoader loader = findPersistLoader("Recordset");
    ASSERT_NE(loader, nullptr);
    EXPECT_EQ(rs->persistTag(), "Recordset");
    Bytes b;
    ByteWriter w(b);
    w.u8(0xAB);
    rs->persist(w);
    w.u8(0xCD);
    ByteReader r(b);
    EXPECT_EQ(r.u8(), 0xAB);
    ObjectRef o = loader(r, 1);
    EXPECT_EQ(r.u8(), 0xCD);
    EXPECT_TRUE(r.atEnd());
    auto* back = query<Recordset>(o.get());
    ASSERT_NE(back, nullptr);
    EXPECT_EQ(snapshot(*back), snapshot(*rs));
}
