// Loads untrusted recordset bytes; a loaded recordset is then walked, filtered,
// sorted and saved again. Only pelta::Error may come out of a load.
#include <cstddef>
#include <cstdint>
#include <span>

#include "platform/automation/error.h"
#include "platform/data/recordset.h"

using namespace pelta;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Ref<Recordset> rs;
    try {
        rs = Recordset::load(std::span<const uint8_t>(data, size));
    } catch (const Error&) {
        return 0;
    }
    try {
        Bytes again = rs->save();
        Recordset::load(again);
        for (rs->moveFirst(); !rs->eof(); rs->moveNext()) {
            for (size_t f = 0; f < rs->fieldCount(); ++f) {
                rs->value(f);
                rs->originalValue(f);
            }
            rs->status();
        }
        if (rs->fieldCount() > 0) {
            const FieldDef& d = rs->fieldDef(0);
            if (d.type != FieldType::Binary) rs->setSort("[" + d.name + "] DESC");
            if (d.type != FieldType::Binary) rs->setFilter("[" + d.name + "] <> NULL");
        }
        rs->setFilter(FilterGroup::Pending);
        rs->recordCount();
        rs->cancelBatch();
        rs->clearFilter();
        rs->recordCount();
    } catch (const Error&) {
        // Names with ']' cannot be written as a filter; values may not convert.
    }
    return 0;
}
