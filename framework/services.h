// The shared framework services and what hangs off them: the host
// application with its logger and debug console, the client site, and the
// store of screen settings.
#pragma once

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <map>
#include <mutex>
#include <set>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "framework/user_agent.h"
#include "library/contracts/Framework.h"

namespace pelta::fw {

class AttribGridExtender;
class FormExtender;
class GridExtender;
class QuickFilterExtender;
class TreeExtender;
class RecordDeletion;

// Writes the host's log files: each Open appends to the named file.
class HostLogger : public PeltaNom15::IHostLogger {
public:
    bool Open(const std::string& FileName) override;
    void Print(const std::string& Line) override;
    int64_t Length() override;  // bytes in the open file; 0 when none is open
    void Close() override;

    const std::string& fileName() const noexcept { return fileName_; }

private:
    std::string fileName_;
    std::ofstream out_;
};

// The debug console and the register of live objects of all libraries.
class DebugConsole : public PeltaNom15::IDebugConsole {
public:
    int32_t NextInstanceID() override;
    bool AddInstance(const std::string& Key, const std::string& Description) override;
    bool RemoveInstance(const std::string& Key) override;
    int32_t InstanceCount() override;
    void RefreshConsole() override;

    // The register: key and description of every live instance.
    std::map<std::string, std::string> instances() const;
    int32_t refreshCount() const;

private:
    mutable std::mutex mutex_;
    int32_t lastID_ = 0;
    int32_t refreshes_ = 0;
    std::map<std::string, std::string> instances_;
};

// An error offered to the host's error hook.
struct OfferedError {
    int32_t number = 0;
    std::string source;
    std::string description;
    std::string location;
};

class HostApplication : public PeltaNom15::IHostApplication {
public:
    HostApplication();

    std::string LogName() override;
    int32_t ErrorHook(int32_t Number, const std::string& Source, const std::string& Description,
                      const std::string& Location) override;
    pelta::Ref<PeltaNom15::IHostLogger> Logger() override;
    pelta::Ref<PeltaNom15::IDebugConsole> DebugConsole() override;
    // Null when the identifier is unknown or creation fails.
    pelta::ObjectRef CreateForm(const std::string& ProgID) override;
    pelta::Variant Option(const std::string& Name) override;

    void setLogName(std::string name);
    // The action code the error hook answers (0, the default: not handled).
    void setErrorAction(int32_t action);
    std::vector<OfferedError> offeredErrors() const;
    void clearOfferedErrors();
    // Null switches the host's own logging or console off.
    void setLogger(pelta::Ref<PeltaNom15::IHostLogger> logger);
    void setDebugConsole(pelta::Ref<PeltaNom15::IDebugConsole> console);
    void setOption(const std::string& name, pelta::Variant value);

private:
    mutable std::mutex mutex_;
    std::string logName_;
    int32_t errorAction_ = 0;
    std::vector<OfferedError> offered_;
    pelta::Ref<PeltaNom15::IHostLogger> logger_;
    pelta::Ref<PeltaNom15::IDebugConsole> console_;
    std::map<std::string, pelta::Variant> options_;
};

// The client site a host hands to a list control or a report.
class ClientSite : public PeltaNom15::IClientSite {
public:
    explicit ClientSite(pelta::Ref<PeltaNom15::IBllConnection> connection, bool selector = false);

    pelta::Ref<PeltaNom15::IBllConnection> Connection() override;
    pelta::Variant Parameter(const std::string& Name) override;
    bool IsSelector() override;

    // Names are compared without regard to ASCII case.
    ClientSite& setParameter(const std::string& name, pelta::Variant value);
    void setSelector(bool selector) noexcept { selector_ = selector; }

private:
    pelta::Ref<PeltaNom15::IBllConnection> connection_;
    std::map<std::string, pelta::Variant> parameters_;  // by lower-case name
    bool selector_;
};

// Screen settings kept per layout key, in memory and, when a file is set, in
// that file (written after every change).
class SettingsStore {
public:
    pelta::Variant get(const std::string& layoutKey, const std::string& name,
                       const pelta::Variant& defaultValue) const;
    void put(const std::string& layoutKey, const std::string& name, pelta::Variant value);
    // Loads the settings kept in `file` (none when it does not exist or cannot
    // be read) and writes every later change there. An empty path keeps
    // settings in memory only.
    void setFile(std::filesystem::path file);
    void clear();  // forgets every setting (the file is left as it is)

private:
    void writeFile() const;

    mutable std::mutex mutex_;
    std::filesystem::path file_;
    std::map<std::string, std::map<std::string, pelta::Variant>> values_;
};

// The one shared instance of the framework services (see instance()).
class FrameworkServices : public PeltaNom15::IFrameworkServices {
public:
    // The process-wide instance; the class factory of kProgIdFrameworkServices
    // answers it too.
    static pelta::Ref<FrameworkServices> instance();

    pelta::Ref<PeltaNom15::IHostApplication> HostApplication() override;
    // Through the calling thread's user agent; raises when there is none.
    int32_t MsgBox(const std::string& Text, int32_t Style, const std::string& Caption,
                   const std::string& Details) override;
    // Null when the identifier is refused (see refuseObject) or cannot be created.
    pelta::ObjectRef CreateObject(const std::string& ProgID) override;
    pelta::Ref<PeltaNom15::IRecordDeletion> RecordDeletion() override;
    int32_t MousePointer() override;
    void SetMousePointer(int32_t Pointer) override;
    // Through the calling thread's user agent (chooseFromList); raises when
    // there is none, when the object is no selector or has no list yet. The
    // list is read first when its grid has nothing bound.
    bool ShowSelector(pelta::Object* Selector, const std::string& Caption,
                      pelta::Variant& Result) override;

    pelta::Ref<fw::HostApplication> host();
    void setHostApplication(pelta::Ref<fw::HostApplication> host);
    // The agent of threads that set none of their own.
    void setUserAgent(pelta::Ref<UserAgent> agent);
    pelta::Ref<UserAgent> userAgent();
    pelta::Ref<fw::RecordDeletion> recordDeletion();
    SettingsStore& settings() noexcept { return settings_; }

    // CreateObject answers null for `progId` (a sibling library that is not
    // installed); allowObject undoes it.
    void refuseObject(const std::string& progId);
    void allowObject(const std::string& progId);

    // Live form extenders (each registers itself while it lives), with the
    // thread that made them: screens live on one user-interface thread, and
    // a host with several (the web shell, one per browser session) looks only
    // at its own thread's forms, which no other thread can destroy meanwhile.
    void addForm(FormExtender* form);
    void removeForm(FormExtender* form);
    std::vector<FormExtender*> forms() const;
    // The live forms made on the calling thread.
    std::vector<FormExtender*> threadForms() const;
    // The form extender whose owner is `owner`, or null.
    FormExtender* formOfOwner(const pelta::Object* owner) const;

    // Live grid extenders, registered as forms are, so that a host finds the
    // grids of a screen it did not make (a detail form opened by a list).
    void addGrid(GridExtender* grid);
    void removeGrid(GridExtender* grid);
    // The grids made on the calling thread whose owner is `owner`, in the
    // order they were made.
    std::vector<GridExtender*> gridsOfOwner(const pelta::Object* owner) const;
    // Live quick filters, registered as grids are.
    void addQuickFilter(QuickFilterExtender* filter);
    void removeQuickFilter(QuickFilterExtender* filter);
    std::vector<QuickFilterExtender*> quickFiltersOfOwner(const pelta::Object* owner) const;
    // Live attribute grids and trees, registered as grids are.
    void addAttribGrid(AttribGridExtender* grid);
    void removeAttribGrid(AttribGridExtender* grid);
    std::vector<AttribGridExtender*> attribGridsOfOwner(const pelta::Object* owner) const;
    void addTree(TreeExtender* tree);
    void removeTree(TreeExtender* tree);
    std::vector<TreeExtender*> treesOfOwner(const pelta::Object* owner) const;

    // Back to a fresh state: default host, no agent, empty settings in
    // memory, nothing refused, pointer 0. Live forms stay registered.
    void reset();

private:
    FrameworkServices();

    mutable std::mutex mutex_;
    pelta::Ref<fw::HostApplication> host_;
    pelta::Ref<UserAgent> agent_;
    pelta::Ref<fw::RecordDeletion> deletion_;
    SettingsStore settings_;
    std::set<std::string> refused_;  // lower-case
    std::vector<std::pair<FormExtender*, std::thread::id>> forms_;
    std::vector<std::pair<GridExtender*, std::thread::id>> grids_;
    std::vector<std::pair<QuickFilterExtender*, std::thread::id>> quickFilters_;
    std::vector<std::pair<AttribGridExtender*, std::thread::id>> attribGrids_;
    std::vector<std::pair<TreeExtender*, std::thread::id>> trees_;
    int32_t mousePointer_ = 0;
};

// Shorthand for FrameworkServices::instance().
pelta::Ref<FrameworkServices> services();

}  // namespace pelta::fw
