#include "library/frame/cFormDispatcher.h"

#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace PeltaNom15 {

cFormDispatcher::cFormDispatcher() : m_sLibName("PeltaNom15") {}

cFormDispatcher::~cFormDispatcher() = default;

std::string cFormDispatcher::LibName() {
    return m_sLibName;
}

pelta::ObjectRef cFormDispatcher::GetForm(std::string&) {
    // No screen of the library can be created by name yet.
    return {};
}

int32_t cFormDispatcher::UnloadAllForms() {
    return 0;
}

void cFormDispatcher::QueryTerminate(bool&) {}

void cFormDispatcher::Terminate() {}

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
