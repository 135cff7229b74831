#include "library/frame/mdNomGlobals.h"

#include <array>
#include <string_view>

#include "library/frame/Forms.h"

namespace PeltaNom15 {

namespace {

constexpr std::array<std::string_view, 16> kTable = {
    "cRepPriceListPrint",    "cRepLabelsPrint",
    "frmPersonsSelector",    "frmDepartmentsSelector",
    "frmItemsBomsSelector",  "frmItemsLotsSelector",
    "frmDimValuesSelector",  "frmContragentsDetails",
    "frmItemsDetails",       "frmDocItemsReserved",
    "frmPrintSortOrder",     "frmCategoriesMasterList",
    "arItemsMinMaxQuantity", "arPriceListWithAvailability",
    "arRepItemsReserved",    "arBomsCost",
};

std::string lower(std::string_view s) {
    std::string r(s);
    for (char& c : r)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    return r;
}

}  // namespace

pelta::ObjectRef FormDispatcherGetForm(const std::string& Name) {
    const std::string name = lower(Name);
    for (std::string_view entry : kTable) {
        if (lower(entry) == name) return CreateRegisteredClass(entry);
    }
    return {};
}

}  // namespace PeltaNom15
