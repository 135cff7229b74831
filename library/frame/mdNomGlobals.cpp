#include "library/frame/mdNomGlobals.h"

#include <array>
#include <string_view>

#include "library/frame/Forms.h"
#include "platform/automation/ascii.h"

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

}  // namespace

pelta::ObjectRef FormDispatcherGetForm(const std::string& Name) {
    const std::string name = pelta::lowerAscii(Name);
    for (std::string_view entry : kTable) {
        if (pelta::lowerAscii(entry) == name) return CreateRegisteredClass(entry);
    }
    return {};
}

}  // namespace PeltaNom15
