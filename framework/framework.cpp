#include "framework/framework.h"

#include "framework/attrib_grid.h"
#include "framework/extenders.h"
#include "framework/form_extender.h"
#include "framework/grid_extender.h"
#include "framework/list_extenders.h"
#include "framework/record_deletion.h"
#include "framework/services.h"
#include "framework/siblings.h"
#include "platform/automation/registry.h"

namespace pelta::fw {

using namespace PeltaNom15;

namespace {

template <class T>
pelta::ObjectRef make() {
    return pelta::ObjectRef(pelta::makeRef<T>());
}

struct ClassOf {
    const char* progId;
    pelta::ObjectRef (*create)();
};

const ClassOf kClasses[] = {
    {kProgIdFrameworkServices, [] { return pelta::ObjectRef(FrameworkServices::instance()); }},
    {kProgIdFormExtender, make<FormExtender>},
    {kProgIdGridExtender, make<GridExtender>},
    {kProgIdDetailOpener, make<DetailOpener>},
    {kProgIdTreeExtender, make<TreeExtender>},
    {kProgIdSplitterExtender, make<SplitterExtender>},
    {kProgIdTabExtender, make<TabExtender>},
    {kProgIdQuickFilterExtender, make<QuickFilterExtender>},
    {kProgIdFooterExtender, make<FooterExtender>},
    {kProgIdPresetExtender, make<PresetExtender>},
    {kProgIdReportExtender, make<ReportExtender>},
    {kProgIdFieldExtender, make<FieldExtender>},
    {kProgIdFilterBandExtender, make<FilterBandExtender>},
    {kProgIdCacheDefExtender, make<CacheDefExtender>},
    {kProgIdAttribGridExtender, make<AttribGridExtender>},
    // Sibling libraries of the suite.
    {kProgIdDmaDetails,
     [] { return pelta::ObjectRef(pelta::makeRef<SiblingForm>(kProgIdDmaDetails)); }},
    {kProgIdStoLedgerItem,
     [] { return pelta::ObjectRef(pelta::makeRef<SiblingReport>(kProgIdStoLedgerItem)); }},
};

// Document lists of the sibling libraries, opened filtered by an item.
const char* const kSiblingLists[] = {
    "PeltaTrade15.ctxInvDocuments",    "PeltaTrade15.ctxSupDocuments",
    "PeltaCrm15.ctxReqDocuments",      "PeltaTrade15.ctxStoDocuments",
    "PeltaTrade15.ctxStoRevDocuments", "PeltaTrade15.ctxWcaDocuments",
    "PeltaAcc15.ctxAccDocuments",      "PeltaCrm15.ctxConDocuments",
    "PeltaCrm15.ctxMrpDocuments",
};

}  // namespace

void registerFramework() {
    for (const auto& c : kClasses)
        pelta::registerLocalClass(c.progId, c.create);
    for (const char* progId : kSiblingLists)
        pelta::registerLocalClass(
            progId, [progId] { return pelta::ObjectRef(pelta::makeRef<SiblingForm>(progId)); });
}

void unregisterFramework() {
    for (const auto& c : kClasses)
        pelta::unregisterLocalClass(c.progId);
    for (const char* progId : kSiblingLists)
        pelta::unregisterLocalClass(progId);
}

std::vector<std::string> frameworkProgIds() {
    std::vector<std::string> out;
    for (const auto& c : kClasses)
        out.emplace_back(c.progId);
    for (const char* progId : kSiblingLists)
        out.emplace_back(progId);
    return out;
}

}  // namespace pelta::fw
