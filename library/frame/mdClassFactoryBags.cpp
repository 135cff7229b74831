// Property bags through the form extender's factory.
#include "library/contracts/Bll.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "platform/data/propertybag.h"

namespace PeltaNom15 {

PropertyBagRef CreatePropertyBag(IFormExtender* Form) {
    try {
        if (Form) return Form->CreatePropertyBag();
        return pelta::makeRef<pelta::PropertyBag>();
    } catch (...) {
        mdErrorHandling::PrintError("CreatePropertyBag", "mdClassFactory");
        return {};
    }
}

PropertyBagRef CreatePropertyBag(IFormExtender* Form, const pelta::Bytes& Contents,
                                 pelta::ObjectRef Context) {
    try {
        if (Form) return Form->CreatePropertyBag(Contents, kBagConst1, kBagConst2, Context);
        return pelta::PropertyBag::fromContents(Contents);
    } catch (...) {
        mdErrorHandling::PrintError("CreatePropertyBag", "mdClassFactory");
        return {};
    }
}

}  // namespace PeltaNom15
