// Refusals of the business logic turned into one Bulgarian message, and the
// readable names of database tables named in them.
#pragma once

#include <cstdint>
#include <string>

#include "library/contracts/Extenders.h"

namespace PeltaNom15 {

// The refusal as a write operation's response carries it ("BllError",
// "BllRowText", "BllDocText", "BllLockName", "BllCgName", "BllILN",
// "BllSqlError", "BllTable", "BllColumn"); absent texts are empty.
struct BllErrorInfo {
    int32_t Code = 0;
    std::string RowText;
    std::string DocText;
    std::string LockName;
    std::string CgName;
    std::string ILN;
    std::string SqlError;
    std::string Table;
    std::string Column;
};

struct BllMessage {
    std::string Text;
    int32_t Style = 0;    // message-box style
    std::string Details;  // the database's own message for codes 18, 19 and 20
};

// Reads the refusal's properties from a response bag.
BllErrorInfo ReadBllError(pelta::PropertyBag* Response);
// The message for a refusal.
BllMessage ComposeBllError(const BllErrorInfo& Error);
// Shows the refusal of `Response` through the form extender's message box and
// returns vbCancel (2); callers stop the failed operation. Shows nothing and
// returns 0 when the response carries no code.
int32_t ShowBllError(IFormExtender* Form, pelta::PropertyBag* Response);

// A table named in a refusal as a phrase ("с 'Продукти'").
std::string BllTableName(const std::string& Table);
// The document text of the stock codes with its markers (character 1)
// turned into words.
std::string BllDocMarkers(const std::string& DocText);

}  // namespace PeltaNom15
