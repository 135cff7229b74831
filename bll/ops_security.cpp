// Rights of the current user, as the framework's detail opener asks for them.
#include "bll/operations.h"

namespace pelta::bll {

namespace {

// Request "Screen" (object name such as "ctxRatios"); response "Rights".
void getUserRights(OperationContext& ctx) {
    std::string screen = ctx.text("Screen");
    ctx.response.writeProperty("Rights", Variant(screen.empty() ? 0 : ctx.rightsOf(screen)));
}

}  // namespace

void registerSecurityOperations(OperationRegistry& r) {
    r.add("GetUserRights", &getUserRights, false);
}

}  // namespace pelta::bll
