// One call of a business-logic operation, as every screen makes it.
#pragma once

#include <string>

#include "library/contracts/Bll.h"
#include "library/contracts/Extenders.h"

namespace PeltaNom15 {

// Sends the request's contents (none when `Request` is null) to `Operation`
// and opens the response through the form extender. Null when the call
// failed: the caller stops without a message of its own.
PropertyBagRef CallBll(IFormExtender* Form, IBllConnection* Connection,
                       const std::string& Operation, pelta::PropertyBag* Request = nullptr);

// The recordset held by a property of a bag; null when the property is
// missing or holds something else.
RecordsetRef RecordsetProperty(pelta::PropertyBag* Bag, const std::string& Name);

}  // namespace PeltaNom15
