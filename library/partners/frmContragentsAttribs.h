// The partner's attribute panel, declared once.
#pragma once

#include <string>
#include <vector>

#include "library/contracts/Controls.h"

namespace PeltaNom15 {

struct AttributeDecl {
    const char* Group;    // "Основни"
    const char* Caption;  // "Ценова листа"
    const char* Field;    // "PriceList_ID"; the control is "att" + Field
    ControlKind Kind;
    const char* Format;     // number format, may be empty
    const char* Values;     // fixed choices "0|Име|1|Име...", may be empty
    const char* Reference;  // the reference list a combo offers, may be empty
};

// "1|Основни|2|Адрес на доставка|...": group numbers and captions.
extern const char* const kAttributeGroups;
const std::vector<AttributeDecl>& ContragentAttributes();

}  // namespace PeltaNom15
