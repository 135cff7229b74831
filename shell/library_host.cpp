#include "shell/library_host.h"

#include <algorithm>
#include <cctype>
#include <filesystem>
#include <system_error>

#include "library/contracts/IZonTerminate.h"
#include "platform/automation/error.h"
#include "platform/automation/registry.h"
#include "platform/automation/variant.h"
#include "shell/log.h"

namespace pelta::shell {

namespace {

bool startsWithNoCase(const std::string& s, const std::string& prefix) {
    if (s.size() < prefix.size()) return false;
    for (size_t i = 0; i < prefix.size(); ++i)
        if (std::tolower(static_cast<unsigned char>(s[i])) !=
            std::tolower(static_cast<unsigned char>(prefix[i])))
            return false;
    return true;
}

// Terminates an object through IZonTerminate, else late-bound by name.
void terminateObject(pelta::Object* o) {
    if (!o) return;
    if (auto* t = pelta::query<PeltaNom15::IZonTerminate>(o)) {
        bool cancel = false;
        t->QueryTerminate(cancel);  // the person has gone: the answer cannot keep it
        t->Terminate();
        return;
    }
    pelta::Variant cancel(false);
    pelta::callByName(o, "QueryTerminate", std::span(&cancel, 1));
    pelta::callByName(o, "Terminate");
}

// Captions of the lists before they are created (a created list's caption
// comes from its form extender).
std::string knownCaption(const std::string& objectName) {
    static const std::pair<const char*, const char*> kCaptions[] = {
        {"ctxRatios", "Валутни курсове"},     {"ctxContragents", "Контрагенти"},
        {"ctxItems", "Продукти и материали"}, {"ctxItemsReserved", "Запазени количества"},
        {"ctxLocks", "Работни периоди"},
    };
    for (const auto& [name, caption] : kCaptions)
        if (objectName == name) return caption;
    return objectName;
}

class Session final : public LibrarySession {
public:
    Session(const std::string& libraryName, const ListAdapterFactory& factory,
            const std::vector<NavigationEntry>& lists, ScreenHost& host)
        : lists_(lists) {
        dispatcher_ = pelta::createObject(libraryName + ".cFormDispatcher");
        if (factory) adapter_ = factory(host);
    }

    std::shared_ptr<Screen> openList(const std::string& id) override {
        auto entry = std::find_if(lists_.begin(), lists_.end(),
                                  [&](const NavigationEntry& e) { return e.id == id; });
        if (entry == lists_.end())
            pelta::raise(pelta::errc::ClassNotAvailable, "The library offers no list " + id,
                         "pelta.shell");
        if (!entry->available)
            pelta::raise(pelta::errc::ClassNotAvailable,
                         "Списъкът \"" + entry->caption + "\" още не е наличен", "pelta.shell");
        if (!adapter_)
            pelta::raise(pelta::errc::ClassNotAvailable,
                         "Lists cannot be shown: no framework hosts them in this program",
                         "pelta.shell");
        return adapter_->openList(pelta::createObject(id));
    }

    void terminate() override {
        pelta::ObjectRef d = std::move(dispatcher_);
        terminateObject(d.get());
        adapter_.reset();  // on this thread, where it was made
    }

private:
    const std::vector<NavigationEntry>& lists_;
    std::unique_ptr<ListAdapter> adapter_;
    pelta::ObjectRef dispatcher_;
};

}  // namespace

LibraryHost::LibraryHost(std::string libraryFile, std::string libraryName)
    : file_(std::move(libraryFile)), name_(std::move(libraryName)) {
    auto reg = reinterpret_cast<pelta::DllRegisterServerFn>(
        pelta::serverEntryPoint(file_, "DllRegisterServer"));
    if (pelta::HResult hr = reg(); hr != pelta::kOk)
        pelta::raise(hr, "DllRegisterServer of " + file_ + " failed", "pelta.shell");
    std::string prefix = name_ + ".ctx";
    for (const pelta::ClassEntry& e : pelta::ClassRegistry().entries()) {
        std::error_code ec;
        if (!startsWithNoCase(e.progId, prefix) || !std::filesystem::equivalent(e.path, file_, ec))
            continue;
        std::string object = e.progId.substr(name_.size() + 1);
        // A list the library cannot make yet is offered, disabled.
        bool available = true;
        try {
            pelta::ObjectRef probe = pelta::createObject(e.progId);
            available = probe != nullptr;
        } catch (const pelta::Error&) {
            available = false;
        }
        lists_.push_back(NavigationEntry{e.progId, knownCaption(object), available});
    }
    // The lists that open first, each group by identifier.
    std::sort(lists_.begin(), lists_.end(), [](const NavigationEntry& a, const NavigationEntry& b) {
        return a.available != b.available ? a.available : a.id < b.id;
    });
    logLine("library " + file_ + ": " + std::to_string(lists_.size()) + " public lists");
}

std::vector<NavigationEntry> LibraryHost::navigation() {
    std::vector<NavigationEntry> out = lists_;
    if (!factory_)
        for (auto& e : out)
            e.available = false;
    return out;
}

std::unique_ptr<LibrarySession> LibraryHost::startSession(ScreenHost& host) {
    return std::make_unique<Session>(name_, factory_, lists_, host);
}

}  // namespace pelta::shell
