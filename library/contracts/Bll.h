// The library's view of the business-logic connection: one call of a named
// operation with a property bag's bytes in and out, the application
// parameters, and the current user.
#pragma once

#include <string>

#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace PeltaNom15 {

// The call kind every call of this library passes.
inline constexpr int32_t kBllCallKind = 4;
// The constants passed with every property-bag creation.
inline constexpr int32_t kBagConst1 = 2;
inline constexpr int32_t kBagConst2 = -2;

// One application parameter (`DefCurrency_ID`, `DefVatPriceScale` ...).
class IAppParameter : public virtual pelta::Object {
public:
    virtual pelta::Variant Value() = 0;
};

// The collection of application parameters, keyed by name.
class IAppParameters : public virtual pelta::Object {
public:
    // Null when there is no parameter of that name.
    virtual pelta::Ref<IAppParameter> Item(const std::string& Name) = 0;
};

class IBllConnection : public virtual pelta::Object {
public:
    // Calls `Operation` with the request bag's bytes. In order: the call kind
    // (4), the operation name, the request bytes (empty when the operation
    // takes no parameters), the response bytes (filled), the value 0, the
    // transport context to hand on when the response is opened (filled), a
    // string passed empty, and the success flag (filled).
    virtual void Call(int32_t CallKind, const std::string& Operation, const pelta::Bytes& Request,
                      pelta::Bytes& Response, int32_t Reserved, pelta::ObjectRef& Context,
                      const std::string& Options, bool& Success) = 0;

    virtual pelta::Ref<IAppParameters> AppParameters() = 0;
    // Key (braced GUID) and name of the user the connection works for.
    virtual std::string CurrentUserID() = 0;
    virtual std::string CurrentUserName() = 0;
};

}  // namespace PeltaNom15
