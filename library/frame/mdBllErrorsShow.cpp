// Reading a refusal from a response bag and showing it.
#include "library/contracts/Constants.h"
#include "library/frame/mdBllErrors.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "platform/data/propertybag.h"

namespace PeltaNom15 {

BllErrorInfo ReadBllError(pelta::PropertyBag* Response) {
    BllErrorInfo e;
    if (!Response) return e;
    auto text = [&](const char* name) { return C2Str(Response->readProperty(name)); };
    e.Code = C2Lng(Response->readProperty("BllError"));
    e.RowText = text("BllRowText");
    e.DocText = text("BllDocText");
    e.LockName = text("BllLockName");
    e.CgName = text("BllCgName");
    e.ILN = text("BllILN");
    e.SqlError = text("BllSqlError");
    e.Table = text("BllTable");
    e.Column = text("BllColumn");
    return e;
}

int32_t ShowBllError(IFormExtender* Form, pelta::PropertyBag* Response) {
    const BllErrorInfo error = ReadBllError(Response);
    if (error.Code == 0) return 0;
    const BllMessage m = ComposeBllError(error);
    try {
        if (Form) {
            Form->MsgBox(m.Text, m.Style, {}, m.Details);
        } else if (auto services = FrameworkServices()) {
            services->MsgBox(m.Text, m.Style, {}, m.Details);
        }
    } catch (...) {
        mdErrorHandling::PrintError("ShowBllError", "mdBllErrors");
    }
    return vbCancel;
}

}  // namespace PeltaNom15
