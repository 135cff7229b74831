#include "library/frame/mdClassFactory.h"

#include <algorithm>

#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdNomGlobals.h"
#include "platform/automation/registry.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kModule = "mdClassFactory";
constexpr const char* kSalesRequestCaption = "Документи за продажба|Документи за заявка";

struct ServicesCache {
    bool tried = false;
    pelta::Ref<IFrameworkServices> services;
};
// Never destroyed: the services may outlive the library's static objects.
ServicesCache& cache() {
    static auto* s = new ServicesCache();
    return *s;
}

// Creates `ProgID` as interface I and initialises it; nothing (logged) when
// either is refused.
template <class I, class F>
pelta::Ref<I> make(const std::string& ProgID, const char* procedure, F&& init) {
    try {
        auto o = pelta::queryRef<I>(CreateFrameworkObject(ProgID));
        if (!o) return {};
        init(*o);
        return o;
    } catch (...) {
        mdErrorHandling::PrintError(procedure, kModule);
        return {};
    }
}

pelta::ObjectRef initSelector(pelta::ObjectRef o, pelta::Object* Owner, const std::string& Param,
                              const char* procedure) {
    if (!o) return {};
    try {
        if (auto* init = pelta::query<IZonSelectorInit>(o.get()))
            if (!init->Init(Owner, Param)) return {};
        return o;
    } catch (...) {
        mdErrorHandling::PrintError(procedure, kModule);
        return {};
    }
}

pelta::ObjectRef selector(const std::string& ProgID, int32_t Index, pelta::Object* Owner,
                          const std::string& Param, const char* procedure) {
    return initSelector(CreateFrameworkObject(SelectorProgID(ProgID, Index)), Owner, Param,
                        procedure);
}

pelta::ObjectRef selectorForm(const std::string& ProgID, int32_t Index, pelta::Object* Owner,
                              const std::string& Param, const char* procedure) {
    pelta::ObjectRef form;
    try {
        if (auto host = HostApplication()) form = host->CreateForm(SelectorProgID(ProgID, Index));
    } catch (...) {
        mdErrorHandling::PrintError(procedure, kModule);
        return {};
    }
    return initSelector(form, Owner, Param, procedure);
}

std::string own(const char* objectName) {
    return std::string(kLibName) + "." + objectName;
}

}  // namespace

pelta::Ref<IFrameworkServices> FrameworkServices() {
    auto& c = cache();
    if (!c.tried) {
        c.tried = true;
        try {
            c.services =
                pelta::queryRef<IFrameworkServices>(pelta::createObject(kProgIdFrameworkServices));
        } catch (...) {
            c.services.reset();
        }
    }
    return c.services;
}

pelta::Ref<IHostApplication> HostApplication() {
    try {
        if (auto services = FrameworkServices()) return services->HostApplication();
    } catch (...) {
    }
    return {};
}

void ResetFrameworkServices() {
    auto& c = cache();
    c.tried = false;
    c.services.reset();
}

pelta::ObjectRef CreateFrameworkObject(const std::string& ProgID) {
    try {
        if (auto services = FrameworkServices()) return services->CreateObject(ProgID);
        return pelta::createObject(ProgID);
    } catch (...) {
        return {};
    }
}

pelta::Ref<IFormExtender> CreateFormExtender(pelta::Object* Owner, const std::string& Caption,
                                             const std::string& ObjectName, int32_t HelpID) {
    return make<IFormExtender>(kProgIdFormExtender, "CreateFormExtender", [&](IFormExtender& x) {
        x.Init(Owner, Caption, kLibName, ObjectName, HelpID);
    });
}

pelta::Ref<IGridExtender> CreateGridExtender(pelta::Object* Owner, const std::string& GridName,
                                             const std::string& LayoutKey, int32_t HelpID) {
    return make<IGridExtender>(kProgIdGridExtender, "CreateGridExtender", [&](IGridExtender& x) {
        x.Init(Owner, GridName, HelpID, LayoutKey);
    });
}

pelta::Ref<IDetailOpener> CreateDetailOpener(IClientSite* Site, const std::string& LayoutKey,
                                             const std::string& ScreenName) {
    return make<IDetailOpener>(kProgIdDetailOpener, "CreateDetailOpener",
                               [&](IDetailOpener& x) { x.Init(Site, LayoutKey, ScreenName); });
}

pelta::Ref<ITreeExtender> CreateTreeExtender(pelta::Object* Owner, const std::string& TreeName,
                                             int32_t HelpID) {
    return make<ITreeExtender>(kProgIdTreeExtender, "CreateTreeExtender",
                               [&](ITreeExtender& x) { x.Init(Owner, TreeName, HelpID); });
}

pelta::Ref<IAttribGridExtender> CreateAttribGridExtender(pelta::Object* Owner,
                                                         const std::string& GridName,
                                                         const std::string& Groups) {
    return make<IAttribGridExtender>(
        kProgIdAttribGridExtender, "CreateAttribGridExtender",
        [&](IAttribGridExtender& x) { x.Init(Owner, GridName, Groups); });
}

pelta::Ref<ISplitterExtender> CreateSplitterExtender(pelta::Object* Owner,
                                                     const std::string& SettingName,
                                                     double Default) {
    return make<ISplitterExtender>(
        kProgIdSplitterExtender, "CreateSplitterExtender",
        [&](ISplitterExtender& x) { x.Init(Owner, SettingName, Default); });
}

pelta::Ref<ITabExtender> CreateTabExtender(pelta::Object* Owner,
                                           const std::vector<std::string>& Captions) {
    return make<ITabExtender>(kProgIdTabExtender, "CreateTabExtender",
                              [&](ITabExtender& x) { x.Init(Owner, Captions); });
}

pelta::Ref<IQuickFilterExtender> CreateQuickFilterExtender(pelta::Object* Owner,
                                                           IGridExtender* Grid,
                                                           const std::string& Hint) {
    return make<IQuickFilterExtender>(kProgIdQuickFilterExtender, "CreateQuickFilterExtender",
                                      [&](IQuickFilterExtender& x) { x.Init(Owner, Grid, Hint); });
}

pelta::Ref<IFooterExtender> CreateFooterExtender(pelta::Object* Owner,
                                                 const std::vector<std::string>& Buttons) {
    return make<IFooterExtender>(kProgIdFooterExtender, "CreateFooterExtender",
                                 [&](IFooterExtender& x) { x.Init(Owner, Buttons); });
}

pelta::Ref<IPresetExtender> CreatePresetExtender(pelta::Object* Owner,
                                                 const std::string& LayoutKey) {
    return make<IPresetExtender>(kProgIdPresetExtender, "CreatePresetExtender",
                                 [&](IPresetExtender& x) { x.Init(Owner, LayoutKey); });
}

pelta::Ref<IReportExtender> CreateReportExtender(pelta::Object* Owner, const std::string& Caption,
                                                 const std::string& ObjectName) {
    return make<IReportExtender>(
        kProgIdReportExtender, "CreateReportExtender",
        [&](IReportExtender& x) { x.Init(Owner, Caption, kLibName, ObjectName); });
}

pelta::Ref<IFieldExtender> CreateFieldExtender(IFormExtender* Form,
                                               const std::string& ControlName) {
    return make<IFieldExtender>(kProgIdFieldExtender, "CreateFieldExtender",
                                [&](IFieldExtender& x) { x.Init(Form, ControlName); });
}

pelta::Ref<IFilterBandExtender> CreateFilterBandExtender(pelta::Object* Owner,
                                                         const std::string& Caption) {
    return make<IFilterBandExtender>(kProgIdFilterBandExtender, "CreateFilterBandExtender",
                                     [&](IFilterBandExtender& x) { x.Init(Owner, Caption); });
}

pelta::Ref<ICacheDefExtender> CreateCacheDefExtender(pelta::Object* Owner,
                                                     const std::string& DataSource) {
    return make<ICacheDefExtender>(kProgIdCacheDefExtender, "CreateCacheDefExtender",
                                   [&](ICacheDefExtender& x) { x.Init(Owner, DataSource); });
}

std::string SelectorProgID(const std::string& ProgID, int32_t Index) {
    std::string r = ProgID;
    const size_t n = Index <= 0 ? 0 : std::min<size_t>(static_cast<size_t>(Index), r.size());
    for (size_t i = r.size() - n; i < r.size(); ++i)
        if (r[i] >= 'a' && r[i] <= 'z') r[i] = static_cast<char>(r[i] - 'a' + 'A');
    return r;
}

pelta::ObjectRef CreateItemsSelector(pelta::Object* Owner, int32_t Index) {
    return selector(own("ctxItems"), Index, Owner, {}, "CreateItemsSelector");
}

pelta::ObjectRef CreateContragentsSelector(pelta::Object* Owner, int32_t Index) {
    return selector(own("ctxContragents"), Index, Owner, {}, "CreateContragentsSelector");
}

bool ShowSelector(pelta::Object* Selector, const std::string& Caption, pelta::Variant& Result) {
    Result = pelta::Variant();
    auto services = FrameworkServices();
    if (!services || !Selector) return false;
    return services->ShowSelector(Selector, Caption, Result);
}

pelta::ObjectRef CreateFlatSelector(pelta::Object* Owner, int32_t Kind, int32_t Index) {
    return selector(own("ctxFlat"), Index, Owner, std::to_string(Kind), "CreateFlatSelector");
}

pelta::ObjectRef CreateMediaSelector(pelta::Object* Owner, int32_t Index) {
    return selector(own("ctxMedia"), Index, Owner, {}, "CreateMediaSelector");
}

pelta::ObjectRef CreateCostCentersSelector(pelta::Object* Owner, const std::string& FilterField,
                                           int32_t Index) {
    return selector(own("ctxCostCenters"), Index, Owner, FilterField, "CreateCostCentersSelector");
}

pelta::ObjectRef CreateItemsBomsSelector(pelta::Object* Owner, const std::string& Param,
                                         int32_t Index) {
    return selectorForm(own("frmItemsBomsSelector"), Index, Owner, Param,
                        "CreateItemsBomsSelector");
}

pelta::ObjectRef CreateDepartmentsSelector(pelta::Object* Owner, const std::string& Param,
                                           int32_t Index) {
    return selectorForm(own("frmDepartmentsSelector"), Index, Owner, Param,
                        "CreateDepartmentsSelector");
}

pelta::ObjectRef CreateItemsLotsSelector(pelta::Object* Owner, const std::string& Param,
                                         int32_t Index) {
    return selectorForm(own("frmItemsLotsSelector"), Index, Owner, Param,
                        "CreateItemsLotsSelector");
}

pelta::ObjectRef CreateAccPrSelector(pelta::Object* Owner, int32_t Index) {
    return selector("PeltaAcc15.ctxPr", Index, Owner, {}, "CreateAccPrSelector");
}

SelectorSet CreateSalesRequestSelectors(pelta::Object* Owner, int32_t Index) {
    auto sales =
        selector("PeltaTrade15.ctxInvDocuments", Index, Owner, {}, "CreateSalesRequestSelectors");
    auto requests =
        selector("PeltaCrm15.ctxReqDocuments", Index, Owner, {}, "CreateSalesRequestSelectors");
    if (!sales || !requests) return {};
    return {kSalesRequestCaption, {sales, requests}};
}

pelta::ObjectRef CreateStoLedgerItemReport(IClientSite* Site) {
    auto report = make<IZonReport>("PeltaTrade15.cRepStoLedgerItem", "CreateStoLedgerItemReport",
                                   [](IZonReport&) {});
    try {
        if (report && report->InitClientSite(Site)) return pelta::ObjectRef(report);
    } catch (...) {
        mdErrorHandling::PrintError("CreateStoLedgerItemReport", kModule);
    }
    return {};
}

}  // namespace PeltaNom15
