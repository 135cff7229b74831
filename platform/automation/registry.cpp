#include "platform/automation/registry.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <map>
#include <mutex>
#include <sstream>

#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace pelta {

namespace fs = std::filesystem;

namespace {

std::string trim(std::string_view s) {
    size_t b = s.find_first_not_of(" \t\r");
    if (b == std::string_view::npos) return {};
    size_t e = s.find_last_not_of(" \t\r");
    return std::string(s.substr(b, e - b + 1));
}

std::vector<ClassEntry> parseRegistry(std::istream& in) {
    std::vector<ClassEntry> out;
    std::optional<ClassEntry> cur;
    auto flush = [&] {
        if (cur && !cur->progId.empty()) out.push_back(*cur);
        cur.reset();
    };
    std::string line;
    while (std::getline(in, line)) {
        std::string t = trim(line);
        if (t.empty() || t[0] == '#' || t[0] == ';') continue;
        if (t.front() == '[' && t.back() == ']') {
            flush();
            if (auto g = Guid::parse(t.substr(1, t.size() - 2))) cur = ClassEntry{*g, {}, {}};
            continue;
        }
        if (!cur) continue;
        auto eq = t.find('=');
        if (eq == std::string::npos) continue;
        std::string key = lowerAscii(trim(t.substr(0, eq)));
        std::string value = trim(t.substr(eq + 1));
        if (key == "progid")
            cur->progId = value;
        else if (key == "inprocserver")
            cur->path = value;
    }
    flush();
    return out;
}

// Holds an exclusive lock on a companion lock file while the registry changes.
class FileLock {
public:
    explicit FileLock(const fs::path& p)
        : fd_(::open(p.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644)) {
        if (fd_ >= 0) ::flock(fd_, LOCK_EX);
    }
    ~FileLock() {
        if (fd_ >= 0) ::close(fd_);
    }
    FileLock(const FileLock&) = delete;
    FileLock& operator=(const FileLock&) = delete;

private:
    int fd_;
};

std::mutex g_localMutex;
std::map<std::string, std::function<ObjectRef()>>& localClasses() {
    static std::map<std::string, std::function<ObjectRef()>> m;
    return m;
}

std::mutex g_libsMutex;
std::map<std::string, void*>& loadedLibraries() {
    static std::map<std::string, void*> m;
    return m;
}

[[noreturn]] void cannotCreate(const std::string& what) {
    raise(errc::CannotCreateObject, describeError(errc::CannotCreateObject) + ": " + what,
          "CreateObject");
}

}  // namespace

fs::path ClassRegistry::defaultPath() {
    if (const char* p = std::getenv("PELTA_REGISTRY"); p && *p) return p;
    if (const char* x = std::getenv("XDG_CONFIG_HOME"); x && *x)
        return fs::path(x) / "pelta" / "registry.ini";
    const char* home = std::getenv("HOME");
    return fs::path(home && *home ? home : "/tmp") / ".config" / "pelta" / "registry.ini";
}

ClassRegistry::ClassRegistry(fs::path file) : file_(std::move(file)) {}

std::vector<ClassEntry> ClassRegistry::entries() const {
    std::ifstream in(file_);
    if (!in) return {};
    return parseRegistry(in);
}

std::optional<ClassEntry> ClassRegistry::findProgId(std::string_view progId) const {
    std::string want = lowerAscii(progId);
    for (auto& e : entries())
        if (lowerAscii(e.progId) == want) return e;
    return std::nullopt;
}

std::optional<ClassEntry> ClassRegistry::findClsid(const Guid& clsid) const {
    for (auto& e : entries())
        if (e.clsid == clsid) return e;
    return std::nullopt;
}

void ClassRegistry::rewrite(const std::function<void(std::vector<ClassEntry>&)>& change) {
    std::error_code ec;
    if (file_.has_parent_path()) fs::create_directories(file_.parent_path(), ec);
    FileLock lock(fs::path(file_) += ".lock");
    auto list = entries();
    change(list);
    fs::path tmp = fs::path(file_) += ".tmp";
    {
        std::ofstream out(tmp, std::ios::trunc);
        if (!out) raise(errc::PathNotFound, "Cannot write the class registry " + tmp.string());
        out << "# Pelta class registry\n";
        for (auto& e : list)
            out << "\n[" << e.clsid.toString() << "]\nProgID=" << e.progId
                << "\nInprocServer=" << e.path << "\n";
        if (!out.flush())
            raise(errc::PathNotFound, "Cannot write the class registry " + tmp.string());
    }
    fs::rename(tmp, file_, ec);
    if (ec) raise(errc::PathNotFound, "Cannot replace the class registry " + file_.string());
}

void ClassRegistry::add(const std::vector<ClassEntry>& classes) {
    rewrite([&](std::vector<ClassEntry>& list) {
        for (auto& c : classes) {
            std::erase_if(list, [&](const ClassEntry& e) { return e.clsid == c.clsid; });
            list.push_back(c);
        }
    });
}

void ClassRegistry::remove(const std::vector<Guid>& clsids) {
    rewrite([&](std::vector<ClassEntry>& list) {
        std::erase_if(list, [&](const ClassEntry& e) {
            for (auto& g : clsids)
                if (g == e.clsid) return true;
            return false;
        });
    });
}

void registerLocalClass(std::string_view progId, std::function<ObjectRef()> factory) {
    std::lock_guard lock(g_localMutex);
    localClasses()[lowerAscii(progId)] = std::move(factory);
}

void unregisterLocalClass(std::string_view progId) {
    std::lock_guard lock(g_localMutex);
    localClasses().erase(lowerAscii(progId));
}

void* serverEntryPoint(const std::string& path, const char* symbol) {
    void* handle = nullptr;
    {
        std::lock_guard lock(g_libsMutex);
        auto& libs = loadedLibraries();
        if (auto it = libs.find(path); it != libs.end()) {
            handle = it->second;
        } else {
            handle = ::dlopen(path.c_str(), RTLD_NOW | RTLD_GLOBAL);
            if (!handle) {
                const char* why = ::dlerror();
                cannotCreate("cannot load library " + path +
                             (why ? std::string(" (") + why + ")" : ""));
            }
            libs.emplace(path, handle);
        }
    }
    void* fn = ::dlsym(handle, symbol);
    if (!fn) cannotCreate("library " + path + " has no entry point " + symbol);
    return fn;
}

ObjectRef createObject(std::string_view progId) {
    std::function<ObjectRef()> local;
    {
        std::lock_guard lock(g_localMutex);
        if (auto it = localClasses().find(lowerAscii(progId)); it != localClasses().end())
            local = it->second;
    }
    if (local) {
        ObjectRef o = local();
        if (!o) cannotCreate(std::string(progId));
        return o;
    }
    auto entry = ClassRegistry().findProgId(progId);
    if (!entry) cannotCreate(std::string(progId) + " is not registered");
    auto getClassObject =
        reinterpret_cast<DllGetClassObjectFn>(serverEntryPoint(entry->path, "DllGetClassObject"));
    ClassFactory* raw = nullptr;
    HResult hr = getClassObject(&entry->clsid, &raw);
    Ref<ClassFactory> factory(raw);
    if (raw) raw->release();  // the entry point handed over one reference
    if (hr != kOk || !factory)
        cannotCreate(std::string(progId) + " is not available in " + entry->path);
    ObjectRef o = factory->createInstance();
    if (!o) cannotCreate(std::string(progId));
    return o;
}

// ---- server side ------------------------------------------------------------

namespace {
class ServerClassFactory final : public ClassFactory {
public:
    ServerClassFactory(ObjectRef (*create)(), std::atomic<int64_t>& count)
        : create_(create), count_(count) {
        count_.fetch_add(1);
    }
    ~ServerClassFactory() override { count_.fetch_sub(1); }
    ObjectRef createInstance() override { return create_(); }

private:
    ObjectRef (*create_)();
    std::atomic<int64_t>& count_;
};

constexpr HResult kClassNotAvailable = static_cast<HResult>(0x80040111);
constexpr HResult kInvalidArgument = static_cast<HResult>(0x80070057);
constexpr HResult kRegistryWriteFailed = static_cast<HResult>(0x80040151);
}  // namespace

InprocServer::InprocServer(std::string libraryName, std::vector<ServerClass> classes,
                           const void* anchor)
    : libraryName_(std::move(libraryName)), classes_(std::move(classes)), anchor_(anchor) {}

std::string InprocServer::libraryPath() const {
    Dl_info info{};
    if (::dladdr(anchor_, &info) && info.dli_fname) {
        std::error_code ec;
        auto p = fs::canonical(info.dli_fname, ec);
        return ec ? std::string(info.dli_fname) : p.string();
    }
    return {};
}

std::vector<ClassEntry> InprocServer::classEntries() const {
    std::vector<ClassEntry> out;
    std::string path = libraryPath();
    for (auto& c : classes_)
        if (auto g = Guid::parse(c.clsid))
            out.push_back(ClassEntry{*g, libraryName_ + "." + c.name, path});
    return out;
}

HResult InprocServer::registerServer() const noexcept {
    try {
        ClassRegistry().add(classEntries());
        return kOk;
    } catch (...) {
        return kRegistryWriteFailed;
    }
}

HResult InprocServer::unregisterServer() const noexcept {
    try {
        std::vector<Guid> ids;
        for (auto& e : classEntries())
            ids.push_back(e.clsid);
        ClassRegistry().remove(ids);
        return kOk;
    } catch (...) {
        return kRegistryWriteFailed;
    }
}

HResult InprocServer::getClassObject(const Guid* clsid, ClassFactory** factory) const noexcept {
    if (!clsid || !factory) return kInvalidArgument;
    *factory = nullptr;
    for (auto& c : classes_) {
        auto g = Guid::parse(c.clsid);
        if (!g || *g != *clsid) continue;
        if (!c.create) return kClassNotAvailable;
        try {
            auto f = makeRef<ServerClassFactory>(c.create, factories_);
            *factory = f.detach();
            return kOk;
        } catch (...) {
            return kClassNotAvailable;
        }
    }
    return kClassNotAvailable;
}

HResult InprocServer::canUnloadNow(int64_t liveObjects) const noexcept {
    return liveObjects == 0 && factories_.load() == 0 ? kOk : kFalse;
}

}  // namespace pelta
