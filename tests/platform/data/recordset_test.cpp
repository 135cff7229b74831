// Recordset shape, cursor, editing with row status, batches, bookmarks,
// sort, find and clones.
#include "platform/data/recordset.h"

#include <gtest/gtest.h>

#include "platform/automation/error.h"

using namespace pelta;

namespace {

Ref<Recordset> items() {
    auto rs = makeRef<Recordset>();
    rs->appendField("ID", FieldType::Long, 0, false);
    rs->appendField("Code", FieldType::Text, 10);
    rs->appendField("Name", FieldType::Text, 50);
    rs->appendDecimalField("Price", 19, 4);
    rs->appendField("IsActive", FieldType::Boolean);
    rs->open();
    return rs;
}

void add(Recordset& rs, int32_t id, const char* code, const char* name, const char* price = "1") {
    rs.addNew();
    rs.setValue("ID", id);
    rs.setValue("Code", code);
    rs.setValue("Name", name);
    rs.setValue("Price", Variant(*Decimal::parse(price)));
    rs.setValue("IsActive", true);
    rs.update();
}

// The IDs of the visible rows in cursor order; leaves the cursor at EOF.
std::vector<int32_t> ids(Recordset& rs) {
    std::vector<int32_t> out;
    if (rs.recordCount() == 0) return out;
    for (rs.moveFirst(); !rs.eof(); rs.moveNext())
        out.push_back(rs.value("ID").toLong());
    return out;
}

int32_t errorOf(const std::function<void()>& f) {
    try {
        f();
    } catch (const Error& e) {
        return e.number();
    }
    return 0;
}

Ref<Recordset> fiveItems() {
    auto rs = items();
    add(*rs, 1, "A1", "Ябълка");
    add(*rs, 2, "B2", "банан");
    add(*rs, 3, "C3", "Apple");
    add(*rs, 4, "D4", "Банан");
    add(*rs, 5, "E5", "ананас");
    rs->updateBatch();
    return rs;
}

}  // namespace

TEST(RecordsetShape, FieldsAreFoundWithoutRegardToCaseIncludingCyrillic) {
    auto rs = makeRef<Recordset>();
    rs->appendField("Име", FieldType::Text, 20);
    rs->appendField("Code", FieldType::Text, 10);
    EXPECT_EQ(rs->fieldIndex("CODE"), 1);
    EXPECT_EQ(rs->fieldIndex("иМЕ"), 0);
    EXPECT_EQ(rs->fieldIndex("Codes"), -1);
    EXPECT_EQ(errorOf([&] { rs->appendField("code", FieldType::Long); }),
              rserr::ObjectInCollection);
    rs->open();
    EXPECT_EQ(errorOf([&] { rs->appendField("X", FieldType::Long); }), rserr::ObjectOpen);
    EXPECT_EQ(errorOf([&] { rs->field("Nope"); }), rserr::ItemNotFound);
    EXPECT_EQ(rs->field("code").definedSize(), 10u);
}

TEST(RecordsetShape, ClosedRecordsetRefusesCursorWork) {
    auto rs = makeRef<Recordset>();
    rs->appendField("A", FieldType::Long);
    EXPECT_EQ(errorOf([&] { rs->addNew(); }), rserr::ObjectClosed);
    EXPECT_EQ(errorOf([&] { rs->moveFirst(); }), rserr::ObjectClosed);
}

TEST(RecordsetValues, EachTypeKeepsItsValueAndKind) {
    auto rs = makeRef<Recordset>();
    rs->appendField("B", FieldType::Boolean);
    rs->appendField("L", FieldType::Long);
    rs->appendField("D", FieldType::Double);
    rs->appendField("C", FieldType::Currency);
    rs->appendDecimalField("N", 10, 2);
    rs->appendField("T", FieldType::Date);
    rs->appendField("G", FieldType::Guid);
    rs->appendField("S", FieldType::Text, 5);
    rs->appendField("M", FieldType::LongText);
    rs->appendField("Y", FieldType::Binary, 4);
    rs->open();
    rs->addNew();
    rs->setValue("B", "True");
    rs->setValue("L", 42.6);  // rounds as CLng
    rs->setValue("D", 1.5);
    rs->setValue("C", "12.34567");
    rs->setValue("N", 1.005);  // rounded half away from zero to the scale
    rs->setValue("T", makeDate(2024, 2, 29, 13, 30));
    rs->setValue("G", "{6f9619ff-8b86-d011-b42d-00c04fc964ff}");
    rs->setValue("S", "Иван");
    rs->setValue("M", std::string(100000, 'x'));
    rs->setValue("Y", Bytes{1, 2, 3});
    rs->update();
    EXPECT_EQ(rs->value("B"), Variant(true));
    EXPECT_EQ(rs->value("L"), Variant(int32_t{43}));
    EXPECT_EQ(rs->value("D"), Variant(1.5));
    EXPECT_EQ(rs->value("C").type(), VarType::Currency);
    EXPECT_EQ(rs->value("C").rawCurrency(), 123457);
    EXPECT_EQ(rs->value("N").type(), VarType::Decimal);
    EXPECT_EQ(rs->value("N").toString(), "1.01");
    EXPECT_EQ(rs->value("T").type(), VarType::Date);
    EXPECT_EQ(rs->value("G").str(), "{6F9619FF-8B86-D011-B42D-00C04FC964FF}");
    EXPECT_EQ(rs->value("S").str(), "Иван");  // four characters fit five
    EXPECT_EQ(rs->value("M").str().size(), 100000u);
    EXPECT_EQ(rs->value("Y"), Variant(Bytes{1, 2, 3}));
    EXPECT_TRUE(rs->field("M").value().isString());
}

TEST(RecordsetValues, ValuesThatDoNotFitAreRefused) {
    auto rs = makeRef<Recordset>();
    rs->appendField("S", FieldType::Text, 3);
    rs->appendField("K", FieldType::Long, 0, false);
    rs->appendDecimalField("N", 5, 2);
    rs->appendField("G", FieldType::Guid);
    rs->appendField("Y", FieldType::Binary, 2);
    rs->open();
    rs->addNew();
    EXPECT_EQ(errorOf([&] { rs->setValue("S", "абвг"); }), rserr::MultipleStep);
    EXPECT_EQ(errorOf([&] { rs->setValue("K", Variant::null()); }), rserr::MultipleStep);
    EXPECT_EQ(errorOf([&] { rs->setValue("K", "many"); }), rserr::MultipleStep);
    EXPECT_EQ(errorOf([&] { rs->setValue("N", 1000); }), rserr::MultipleStep);
    EXPECT_EQ(errorOf([&] { rs->setValue("N", 999.99); }), 0);
    EXPECT_EQ(errorOf([&] { rs->setValue("G", "not a guid"); }), rserr::MultipleStep);
    EXPECT_EQ(errorOf([&] { rs->setValue("Y", Bytes{1, 2, 3}); }), rserr::MultipleStep);
    EXPECT_TRUE(rs->value("S").isNull());  // a refused value leaves the old one
}

TEST(RecordsetCursor, EmptyRecordsetIsAtBothEnds) {
    auto rs = items();
    EXPECT_TRUE(rs->bof());
    EXPECT_TRUE(rs->eof());
    EXPECT_EQ(rs->recordCount(), 0);
    rs->moveFirst();
    rs->moveLast();
    EXPECT_TRUE(rs->bof() && rs->eof());
    EXPECT_EQ(errorOf([&] { rs->moveNext(); }), rserr::NoCurrentRecord);
    EXPECT_EQ(errorOf([&] { rs->value("ID"); }), rserr::NoCurrentRecord);
}

TEST(RecordsetCursor, MovesAndPositions) {
    auto rs = fiveItems();
    EXPECT_EQ(rs->recordCount(), 5);
    rs->moveFirst();
    EXPECT_EQ(rs->absolutePosition(), 1);
    rs->moveLast();
    EXPECT_EQ(rs->value("ID").toLong(), 5);
    rs->moveNext();
    EXPECT_TRUE(rs->eof());
    EXPECT_EQ(rs->absolutePosition(), kPosEof);
    EXPECT_EQ(errorOf([&] { rs->moveNext(); }), rserr::NoCurrentRecord);
    rs->movePrevious();
    EXPECT_EQ(rs->value("ID").toLong(), 5);
    rs->move(-3);
    EXPECT_EQ(rs->value("ID").toLong(), 2);
    rs->move(-5);
    EXPECT_TRUE(rs->bof());
    EXPECT_EQ(rs->absolutePosition(), kPosBof);
    rs->setAbsolutePosition(4);
    EXPECT_EQ(rs->value("ID").toLong(), 4);
    Variant bm = rs->bookmark();
    rs->moveFirst();
    rs->move(1, bm);
    EXPECT_EQ(rs->value("ID").toLong(), 5);
    EXPECT_EQ(errorOf([&] { rs->setAbsolutePosition(6); }), rserr::InvalidArgument);
}

TEST(RecordsetEditing, StatusFollowsEditsAndBatches) {
    auto rs = fiveItems();
    rs->moveFirst();
    EXPECT_EQ(rs->status(), RowStatus::Unmodified);
    rs->setValue("Name", "Круша");
    EXPECT_EQ(rs->editMode(), EditMode::InProgress);
    rs->update();
    EXPECT_EQ(rs->status(), RowStatus::Modified);
    EXPECT_EQ(rs->value("Name").str(), "Круша");
    EXPECT_EQ(rs->originalValue("Name").str(), "Ябълка");
    // A second edit keeps the first original value.
    rs->setValue("Name", "Слива");
    rs->moveNext();  // moving updates the edit
    rs->movePrevious();
    EXPECT_EQ(rs->value("Name").str(), "Слива");
    EXPECT_EQ(rs->originalValue("Name").str(), "Ябълка");

    rs->moveNext();
    rs->setValue("Code", "ZZ");
    rs->cancelUpdate();
    EXPECT_EQ(rs->value("Code").str(), "B2");
    EXPECT_EQ(rs->status(), RowStatus::Unmodified);
    rs->deleteRecord();
    EXPECT_EQ(rs->recordCount(), 4);

    add(*rs, 6, "F6", "Нов");
    EXPECT_EQ(rs->status(), RowStatus::New);
    EXPECT_TRUE(rs->originalValue("Name").isNull());

    rs->setFilter(FilterGroup::Pending);
    EXPECT_EQ(rs->recordCount(), 3);
    std::vector<RowStatus> st;
    for (rs->moveFirst(); !rs->eof(); rs->moveNext())
        st.push_back(rs->status());
    EXPECT_EQ(st,
              (std::vector<RowStatus>{RowStatus::Modified, RowStatus::Deleted, RowStatus::New}));

    rs->updateBatch();
    EXPECT_EQ(rs->recordCount(), 0);  // nothing pending
    rs->clearFilter();
    EXPECT_EQ(ids(*rs), (std::vector<int32_t>{1, 3, 4, 5, 6}));
    for (rs->moveFirst(); !rs->eof(); rs->moveNext()) {
        EXPECT_EQ(rs->status(), RowStatus::Unmodified);
        EXPECT_EQ(rs->originalValue("Name"), rs->value("Name"));
    }
}

TEST(RecordsetEditing, CancelBatchRestoresEverything) {
    auto rs = fiveItems();
    rs->moveFirst();
    rs->setValue("Price", 99);
    rs->update();
    rs->moveNext();
    rs->deleteRecord();
    add(*rs, 6, "F6", "Нов");
    rs->moveLast();
    rs->cancelBatch();
    EXPECT_EQ(ids(*rs), (std::vector<int32_t>{1, 2, 3, 4, 5}));
    rs->moveFirst();
    EXPECT_EQ(rs->value("Price").toString(), "1");
    EXPECT_EQ(rs->status(), RowStatus::Unmodified);
}

TEST(RecordsetEditing, CancelledAddNewLeavesNoRow) {
    auto rs = fiveItems();
    rs->addNew();
    rs->setValue("ID", 9);
    EXPECT_EQ(rs->editMode(), EditMode::Add);
    rs->cancelUpdate();
    EXPECT_EQ(rs->recordCount(), 5);
    EXPECT_EQ(rs->value("ID").toLong(), 5);
    rs->setFilter(FilterGroup::Pending);
    EXPECT_EQ(rs->recordCount(), 0);
}

TEST(RecordsetEditing, DeleteEveryRowWhileMoving) {
    auto rs = fiveItems();
    rs->moveFirst();
    while (!rs->eof()) {
        rs->deleteRecord();
        rs->moveNext();
    }
    EXPECT_EQ(rs->recordCount(), 0);
    EXPECT_TRUE(rs->bof() && rs->eof());
    rs->setFilter(FilterGroup::Pending);
    EXPECT_EQ(rs->recordCount(), 5);
}

TEST(RecordsetEditing, CurrentRowDeletedThenCountedStaysInPlace) {
    auto rs = fiveItems();
    rs->setAbsolutePosition(3);
    rs->deleteRecord();
    EXPECT_EQ(rs->recordCount(), 4);
    EXPECT_EQ(errorOf([&] { rs->value("ID"); }), rserr::NoCurrentRecord);
    rs->moveNext();
    EXPECT_EQ(rs->value("ID").toLong(), 4);
    rs->setAbsolutePosition(3);
    rs->deleteRecord();
    EXPECT_EQ(rs->recordCount(), 3);
    rs->movePrevious();
    EXPECT_EQ(rs->value("ID").toLong(), 2);
    // The last row deleted and counted: not yet EOF, MoveNext gets there.
    rs->moveLast();
    rs->deleteRecord();
    EXPECT_EQ(rs->recordCount(), 2);
    EXPECT_FALSE(rs->eof());
    rs->moveNext();
    EXPECT_TRUE(rs->eof());
    rs->movePrevious();
    EXPECT_EQ(rs->value("ID").toLong(), 2);
}

TEST(RecordsetBookmarks, StableAcrossFilterAndSort) {
    auto rs = fiveItems();
    rs->setAbsolutePosition(4);
    Variant bm4 = rs->bookmark();
    rs->moveFirst();
    Variant bm1 = rs->bookmark();
    EXPECT_EQ(rs->compareBookmarks(bm1, bm4), -1);
    rs->setSort("ID DESC");
    rs->setBookmark(bm4);
    EXPECT_EQ(rs->value("Code").str(), "D4");
    EXPECT_EQ(rs->compareBookmarks(bm1, bm4), 1);
    rs->setFilter("Code = 'D4' OR Code = 'A1'");
    rs->setBookmark(bm1);
    EXPECT_EQ(rs->value("ID").toLong(), 1);
    EXPECT_EQ(rs->bookmark(), bm1);
    rs->setFilter("Code = 'A1'");
    EXPECT_EQ(errorOf([&] { rs->setBookmark(bm4); }), rserr::InvalidArgument);
    EXPECT_EQ(errorOf([&] { rs->setBookmark(Variant(1e9)); }), rserr::InvalidArgument);
    EXPECT_EQ(errorOf([&] { rs->setBookmark(Variant("x")); }), rserr::InvalidArgument);
    // Bookmark filter keeps the current order.
    rs->clearFilter();
    std::vector<Variant> bms{bm1, bm4};
    rs->setFilter(Variant(bms));
    EXPECT_EQ(ids(*rs), (std::vector<int32_t>{4, 1}));
    EXPECT_EQ(rs->filter().type(), VarType::Array);
    // A bookmark of a row that is gone is refused.
    rs->clearFilter();
    rs->setBookmark(bm4);
    rs->deleteRecord();
    rs->updateBatch();
    EXPECT_EQ(errorOf([&] { rs->setBookmark(bm4); }), rserr::InvalidArgument);
}

TEST(RecordsetSort, BulgarianCollationStableAndMultiKey) {
    auto rs = fiveItems();
    add(*rs, 6, "F6", "банан");
    rs->addNew();  // Name Null sorts first
    rs->setValue("ID", 7);
    rs->update();
    rs->setSort("Name");
    // Cyrillic before Latin in Bulgarian; lower case before upper within the
    // same letters; equal names keep their order (2 before 6).
    EXPECT_EQ(ids(*rs), (std::vector<int32_t>{7, 5, 2, 6, 4, 1, 3}));
    rs->setSort("[Name] DESC, ID DESC");
    EXPECT_EQ(ids(*rs), (std::vector<int32_t>{3, 1, 4, 6, 2, 5, 7}));
    EXPECT_EQ(rs->sort(), "[Name] DESC, ID DESC");
    // A filter applies over the sorted order.
    rs->setFilter("Name LIKE 'б*'");
    EXPECT_EQ(ids(*rs), (std::vector<int32_t>{4, 6, 2}));
    rs->setSort("");
    EXPECT_EQ(ids(*rs), (std::vector<int32_t>{2, 4, 6}));
}

TEST(RecordsetSort, MalformedSortNamesThePosition) {
    auto rs = fiveItems();
    try {
        rs->setSort("Name ASC, Nope DESC");
        FAIL();
    } catch (const Error& e) {
        EXPECT_EQ(e.number(), rserr::InvalidArgument);
        EXPECT_NE(e.description().find("position 11"), std::string::npos) << e.description();
    }
    EXPECT_EQ(errorOf([&] { rs->setSort("Name Code"); }), rserr::InvalidArgument);
}

TEST(RecordsetFind, ForwardBackwardSkipAndStart) {
    auto rs = fiveItems();
    rs->moveFirst();
    EXPECT_TRUE(rs->find("Code = 'c3'"));
    EXPECT_EQ(rs->value("ID").toLong(), 3);
    EXPECT_TRUE(rs->find("Name LIKE '*нан*'"));  // the current row counts
    EXPECT_EQ(rs->value("ID").toLong(), 4);
    EXPECT_TRUE(rs->find("Name LIKE '*нан*'", 1));
    EXPECT_EQ(rs->value("ID").toLong(), 5);
    EXPECT_TRUE(rs->find("Name LIKE 'БАН*'", 1, SearchDirection::Backward));
    EXPECT_EQ(rs->value("ID").toLong(), 4);
    EXPECT_FALSE(rs->find("Code = 'D4'", 1, SearchDirection::Backward));
    EXPECT_TRUE(rs->bof());
    rs->setAbsolutePosition(5);
    Variant last = rs->bookmark();
    rs->moveFirst();
    EXPECT_FALSE(rs->find("ID < 3", 0, SearchDirection::Forward, last));
    EXPECT_TRUE(rs->eof());
    EXPECT_TRUE(rs->find("ID < 3", 0, SearchDirection::Backward, last));
    EXPECT_EQ(rs->value("ID").toLong(), 2);
    EXPECT_EQ(errorOf([&] { rs->find("ID = 1 AND Code = 'A1'"); }), rserr::InvalidArgument);
    EXPECT_EQ(errorOf([&] { rs->find("ID = 1 OR ID = 2"); }), rserr::InvalidArgument);
}

TEST(RecordsetClone, SharesRowsButNotCursorFilterOrSort) {
    auto rs = fiveItems();
    rs->setFilter("ID > 2");
    rs->setSort("ID DESC");
    auto c = rs->clone();
    EXPECT_EQ(c->recordCount(), 5);
    EXPECT_EQ(c->value("ID").toLong(), 1);
    EXPECT_TRUE(c->filter() == Variant(int32_t{0}));

    // A change through the clone is seen through the original.
    c->setAbsolutePosition(5);
    c->setValue("Name", "Манго");
    c->update();
    rs->moveFirst();
    EXPECT_EQ(rs->value("Name").str(), "Манго");
    EXPECT_EQ(rs->status(), RowStatus::Modified);

    // A row added through either is seen by the other.
    add(*c, 10, "X", "Нова");
    EXPECT_EQ(rs->recordCount(), 4);  // matches ID > 2
    rs->moveLast();
    EXPECT_EQ(rs->value("ID").toLong(), 10);
    add(*rs, 11, "Y", "Още");
    EXPECT_EQ(c->recordCount(), 7);

    // Deleting through the original removes the row from the clone.
    rs->moveFirst();
    Variant bm = rs->bookmark();
    rs->deleteRecord();
    EXPECT_EQ(c->recordCount(), 6);
    EXPECT_EQ(errorOf([&] { c->setBookmark(bm); }), rserr::InvalidArgument);

    // Bookmarks are shared.
    rs->moveFirst();
    Variant bm4 = rs->bookmark();
    c->setBookmark(bm4);
    EXPECT_EQ(c->value("ID").toLong(), rs->value("ID").toLong());

    // Batches act on the shared rows.
    c->cancelBatch();
    rs->clearFilter();
    EXPECT_EQ(rs->recordCount(), 5);
    rs->setBookmark(bm);
    EXPECT_EQ(rs->value("Name").str(), "ананас");
    EXPECT_EQ(rs->status(), RowStatus::Unmodified);

    // The clone outlives the original.
    rs.reset();
    EXPECT_EQ(c->recordCount(), 5);
}
