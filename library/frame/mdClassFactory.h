// Creation of the framework's objects. Each routine creates one object by
// the framework's programmatic identifier and initialises it, and returns
// nothing when the framework refuses to create or initialise it.
#pragma once

#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "library/contracts/Extenders.h"
#include "library/contracts/Framework.h"
#include "library/contracts/Public.h"

namespace PeltaNom15 {

// The shared framework services, created once by kProgIdFrameworkServices;
// null when there is no framework (then there is no error hook, no host
// logger, and no message box can be shown).
pelta::Ref<IFrameworkServices> FrameworkServices();
// The host application of the framework services; null without them.
pelta::Ref<IHostApplication> HostApplication();
// Forgets the framework services so that the next call creates them again
// (for hosts that register the framework after the library was loaded).
void ResetFrameworkServices();

// An object of another library or of the framework by programmatic
// identifier: through the framework services when there are any, else
// through the class registry. Null when it cannot be created.
pelta::ObjectRef CreateFrameworkObject(const std::string& ProgID);

// Extenders.
pelta::Ref<IFormExtender> CreateFormExtender(pelta::Object* Owner, const std::string& Caption,
                                             const std::string& ObjectName, int32_t HelpID = 0);
pelta::Ref<IGridExtender> CreateGridExtender(pelta::Object* Owner, const std::string& GridName,
                                             const std::string& LayoutKey, int32_t HelpID = 0);
pelta::Ref<IDetailOpener> CreateDetailOpener(IClientSite* Site, const std::string& LayoutKey,
                                             const std::string& ScreenName);
pelta::Ref<ITreeExtender> CreateTreeExtender(pelta::Object* Owner, const std::string& TreeName,
                                             int32_t HelpID = 0);
// `Groups` "1|Основни|2|Мерки|...".
pelta::Ref<IAttribGridExtender> CreateAttribGridExtender(pelta::Object* Owner,
                                                         const std::string& GridName,
                                                         const std::string& Groups);
pelta::Ref<ISplitterExtender> CreateSplitterExtender(pelta::Object* Owner,
                                                     const std::string& SettingName,
                                                     double Default);
pelta::Ref<ITabExtender> CreateTabExtender(pelta::Object* Owner,
                                           const std::vector<std::string>& Captions);
pelta::Ref<IQuickFilterExtender> CreateQuickFilterExtender(pelta::Object* Owner,
                                                           IGridExtender* Grid,
                                                           const std::string& Hint);
pelta::Ref<IFooterExtender> CreateFooterExtender(pelta::Object* Owner,
                                                 const std::vector<std::string>& Buttons);
pelta::Ref<IPresetExtender> CreatePresetExtender(pelta::Object* Owner,
                                                 const std::string& LayoutKey);
pelta::Ref<IReportExtender> CreateReportExtender(pelta::Object* Owner, const std::string& Caption,
                                                 const std::string& ObjectName);
pelta::Ref<IFieldExtender> CreateFieldExtender(IFormExtender* Form, const std::string& ControlName);
pelta::Ref<IFilterBandExtender> CreateFilterBandExtender(pelta::Object* Owner,
                                                         const std::string& Caption);
pelta::Ref<ICacheDefExtender> CreateCacheDefExtender(pelta::Object* Owner,
                                                     const std::string& DataSource);

// Property bags through the form extender's factory: an empty request bag,
// or a response opened from its bytes and transport context.
PropertyBagRef CreatePropertyBag(IFormExtender* Form);
PropertyBagRef CreatePropertyBag(IFormExtender* Form, const pelta::Bytes& Contents,
                                 pelta::ObjectRef Context);

// `ProgID` with its last `Index` characters upper-cased (0 leaves it as it
// is): the same class under an identifier of its own for each selector index.
std::string SelectorProgID(const std::string& ProgID, int32_t Index);

// Selectors over the library's list controls, initialised (IZonSelectorInit)
// with the owner and a parameter.
pelta::ObjectRef CreateItemsSelector(pelta::Object* Owner, int32_t Index = 0);
pelta::ObjectRef CreateContragentsSelector(pelta::Object* Owner, int32_t Index = 0);
// Shows a selector made above (after its InitClientSite) to the person
// through the framework; False when cancelled, when nothing was chosen or
// when there is no framework. `Result` is the selector's answer.
bool ShowSelector(pelta::Object* Selector, const std::string& Caption, pelta::Variant& Result);
// `Kind` is the flat nomenclature's kind number, passed as text.
pelta::ObjectRef CreateFlatSelector(pelta::Object* Owner, int32_t Kind, int32_t Index = 0);
pelta::ObjectRef CreateMediaSelector(pelta::Object* Owner, int32_t Index = 0);
// `FilterField` is "StructureCC_ID", "ProjectCC_ID" or "OtherCC_ID".
pelta::ObjectRef CreateCostCentersSelector(pelta::Object* Owner, const std::string& FilterField,
                                           int32_t Index = 0);

// Selector forms, created through the host application by programmatic
// identifier and initialised with their Init member.
pelta::ObjectRef CreateItemsBomsSelector(pelta::Object* Owner, const std::string& Param,
                                         int32_t Index = 0);
pelta::ObjectRef CreateDepartmentsSelector(pelta::Object* Owner, const std::string& Param,
                                           int32_t Index = 0);
pelta::ObjectRef CreateItemsLotsSelector(pelta::Object* Owner, const std::string& Param,
                                         int32_t Index = 0);

// Selectors of sibling libraries.
pelta::ObjectRef CreateAccPrSelector(pelta::Object* Owner, int32_t Index = 0);
// The sales documents and request documents selector pair, with its caption
// "Документи за продажба|Документи за заявка" (one part per selector, in
// that order); empty when either cannot be made.
struct SelectorSet {
    std::string Caption;
    std::vector<pelta::ObjectRef> Selectors;
};
SelectorSet CreateSalesRequestSelectors(pelta::Object* Owner, int32_t Index = 0);

// The sibling report of an item's stock ledger, initialised with the site.
pelta::ObjectRef CreateStoLedgerItemReport(IClientSite* Site);

}  // namespace PeltaNom15
