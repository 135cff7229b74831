#include "library/frame/cFormDispatcher.h"

#include <vector>

#include "library/frame/Forms.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/frame/mdNomGlobals.h"
#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kModule = "cFormDispatcher";

// The loaded forms as one collection, in the order of the Forms collection.
std::vector<pelta::Variant> loadedForms() {
    std::vector<pelta::Variant> forms;
    for (auto& form : Forms().Items())
        forms.emplace_back(pelta::ObjectRef(form));
    return {pelta::Variant(std::move(forms))};
}

}  // namespace

cFormDispatcher::cFormDispatcher() : m_sLibName(kLibName) {
    mdErrorHandling::DebugInstanceInit(kModule, m_lDebugID, this);
}

cFormDispatcher::~cFormDispatcher() {
    mdErrorHandling::DebugInstanceTerm(kModule, m_lDebugID);
}

std::string cFormDispatcher::LibName() {
    return m_sLibName;
}

pelta::ObjectRef cFormDispatcher::GetForm(std::string& Name) {
    try {
        if (pelta::ObjectRef o = FormDispatcherGetForm(Name)) return o;
        mdErrorHandling::LogError(
            0, "Using Forms.Add for " + m_sLibName + "." + Name,
            mdErrorHandling::FormatLocation(kModule, "IZonFormDispatcher_GetForm"), {});
        return Forms().Add(Name);
    } catch (...) {
        PrintError("IZonFormDispatcher_GetForm(sForm=" + Name + ")", kModule);
        return {};
    }
}

int32_t cFormDispatcher::UnloadAllForms() {
    try {
        // Unloading shrinks the collection: walk a copy taken beforehand.
        for (auto& form : Forms().Items())
            form->Unload();
        return Forms().Count();
    } catch (...) {
        return Forms().Count();
    }
}

void cFormDispatcher::QueryTerminate(bool& Cancel) {
    try {
        std::vector<pelta::Variant> forms = loadedForms();
        QueryTerminateObjects(Cancel, forms);
    } catch (...) {
    }
}

void cFormDispatcher::Terminate() {
    try {
        std::vector<pelta::Variant> forms = loadedForms();
        TerminateObjects(forms);
    } catch (...) {
    }
}

pelta::Variant cFormDispatcher::invoke(std::string_view member, pelta::CallKind kind,
                                       std::span<pelta::Variant> args) {
    using pelta::memberIs;
    if (memberIs(member, "LibName")) return LibName();
    if (memberIs(member, "UnloadAllForms")) return UnloadAllForms();
    if (memberIs(member, "GetForm")) {
        if (args.empty()) pelta::raise(pelta::errc::WrongArgumentCount, {});
        std::string name = args[0].toString();
        auto form = GetForm(name);
        args[0] = name;
        return form;
    }
    if (memberIs(member, "QueryTerminate")) {
        if (args.empty()) pelta::raise(pelta::errc::WrongArgumentCount, {});
        bool cancel = args[0].toBool();
        QueryTerminate(cancel);
        args[0] = cancel;
        return {};
    }
    if (memberIs(member, "Terminate")) {
        Terminate();
        return {};
    }
    return LibObject::invoke(member, kind, args);
}

}  // namespace PeltaNom15
