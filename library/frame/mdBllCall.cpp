#include "library/frame/mdBllCall.h"

#include "library/frame/mdClassFactory.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

PropertyBagRef CallBll(IFormExtender* Form, IBllConnection* Connection,
                       const std::string& Operation, pelta::PropertyBag* Request) {
    if (!Connection) return {};
    pelta::Bytes response;
    pelta::ObjectRef context;
    bool success = false;
    Connection->Call(kBllCallKind, Operation, Request ? Request->contents() : pelta::Bytes{},
                     response, 0, context, {}, success);
    if (!success) return {};
    return CreatePropertyBag(Form, response, context);
}

RecordsetRef RecordsetProperty(pelta::PropertyBag* Bag, const std::string& Name) {
    if (!Bag) return {};
    pelta::Variant v = Bag->readProperty(Name);
    return RecordsetRef(pelta::query<pelta::Recordset>(v.object()));
}

}  // namespace PeltaNom15
