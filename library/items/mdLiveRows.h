// The rows of an item's list that are still there: a list keeps the rows the
// person deleted (marked Deleted) until the save sends them.
#pragma once

#include <string_view>
#include <vector>

#include "library/contracts/Extenders.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

// Visits the rows not deleted, among those matching `Criteria` (empty: all),
// on a clone, so that the list's own position stays.
template <class F>
void ForLiveRows(const RecordsetRef& Rows, F&& Visit, std::string_view Criteria = {}) {
    if (!Rows || Rows->recordCount() == 0) return;
    auto r = Rows->clone();
    if (!Criteria.empty()) r->setFilter(Criteria);
    if (r->recordCount() == 0) return;
    for (r->moveFirst(); !r->eof(); r->moveNext())
        if (r->status() != pelta::RowStatus::Deleted) Visit(*r);
}

// The bookmarks of those rows.
inline std::vector<pelta::Variant> LiveBookmarks(const RecordsetRef& Rows,
                                                 std::string_view Criteria = {}) {
    std::vector<pelta::Variant> marks;
    ForLiveRows(Rows, [&](pelta::Recordset& r) { marks.push_back(r.bookmark()); }, Criteria);
    return marks;
}

}  // namespace PeltaNom15
