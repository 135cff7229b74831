// Untrusted filter, find and sort texts over a recordset with a field of each
// kind. Only pelta::Error may come out.
#include <cstddef>
#include <cstdint>
#include <string_view>

#include "platform/automation/error.h"
#include "platform/data/recordset.h"

using namespace pelta;

namespace {
Ref<Recordset> makeData() {
    auto rs = makeRef<Recordset>();
    rs->appendField("ID", FieldType::Guid);
    rs->appendField("Code", FieldType::Text, 20);
    rs->appendField("Name", FieldType::Text, 50);
    rs->appendDecimalField("Price", 19, 4);
    rs->appendField("Cur", FieldType::Currency);
    rs->appendField("IsActive", FieldType::Boolean);
    rs->appendField("Qty", FieldType::Double);
    rs->appendField("N", FieldType::Long);
    rs->appendField("CD", FieldType::Date);
    rs->appendField("Note", FieldType::LongText);
    rs->appendField("Pic", FieldType::Binary);
    rs->appendField("Item Name", FieldType::Text);
    rs->open();
    const char* names[] = {"Иван",        "иван",    "IVAN", "Kelvin \u212A",
                           "long \u017F", "O'Brien", "",     "Ябълка"};
    for (int i = 0; i < 16; ++i) {
        rs->addNew();
        if (i % 5 == 4) continue;  // a row of Nulls
        rs->setValue("ID", "{00000000-0000-0000-0000-00000000000" + std::to_string(i % 10) + "}");
        rs->setValue("Code", "C" + std::to_string(i));
        rs->setValue("Name", names[i % 8]);
        rs->setValue("Price", Variant(Decimal(i * 7)));
        rs->setValue("Cur", Variant(Currency{i * 12345}));
        rs->setValue("IsActive", i % 2 == 0);
        rs->setValue("Qty", i * 0.5);
        rs->setValue("N", i - 8);
        rs->setValue("CD", Date{45000.0 + i});
        rs->setValue("Note", std::string(static_cast<size_t>(i), '*'));
        rs->setValue("Pic", Bytes{static_cast<uint8_t>(i)});
    }
    rs->update();
    rs->updateBatch();
    return rs;
}
}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    static Ref<Recordset> rs = makeData();
    std::string_view text(reinterpret_cast<const char*>(data), size);
    try {
        rs->setFilter(text);
        for (rs->moveFirst(); !rs->eof(); rs->moveNext())
            rs->value(size_t{1});
    } catch (const Error&) {
    }
    rs->clearFilter();
    try {
        rs->find(text, 0, size % 2 ? SearchDirection::Backward : SearchDirection::Forward);
    } catch (const Error&) {
    }
    try {
        rs->setSort(text);
    } catch (const Error&) {
    }
    rs->setSort("");
    return 0;
}
