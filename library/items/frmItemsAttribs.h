// The further fields of an item edited in the item editor's attribute grid,
// declared once with their groups, editors and help texts.
#pragma once

#include <vector>

#include "library/contracts/Extenders.h"

namespace PeltaNom15 {

// "1|Основни|2|Мерки|...": the groups of the attribute grid in their order.
extern const char* const kItemAttribGroups;

struct ItemAttribute {
    AttribDecl Decl;
    const char* Reference;  // the reference list a list or tree list offers, may be empty
};

const std::vector<ItemAttribute>& ItemAttributes();

}  // namespace PeltaNom15
