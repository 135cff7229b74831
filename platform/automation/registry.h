// The class registry and the in-process server protocol, the stand-in for the
// operating system's class registration and object activation.
//
// A library registers each public class with its fixed class identifier, its
// programmatic identifier and the library's path in a registry file; a host
// creates objects by programmatic identifier, which loads the library once and
// asks its class object for an instance. Stand-ins living inside the host
// process (framework objects, sibling libraries) register a local factory.
#pragma once

#include <atomic>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/automation/guid.h"
#include "platform/automation/object.h"

namespace pelta {

using HResult = int32_t;
inline constexpr HResult kOk = 0;
inline constexpr HResult kFalse = 1;

// Class object of an in-process server.
class ClassFactory : public virtual Object {
public:
    virtual ObjectRef createInstance() = 0;
};

// The C entry points every in-process server library exports.
extern "C" {
using DllRegisterServerFn = HResult (*)();
using DllUnregisterServerFn = HResult (*)();
using DllGetClassObjectFn = HResult (*)(const Guid* clsid, ClassFactory** factory);
using DllCanUnloadNowFn = HResult (*)();
}

struct ClassEntry {
    Guid clsid;
    std::string progId;
    std::string path;  // the library file
};

// The registry file: one section per class identifier.
//   [{CLSID}]
//   ProgID=PeltaNom15.ctxItems
//   InprocServer=/path/libPeltaNom15.so
class ClassRegistry {
public:
    // $PELTA_REGISTRY, else $XDG_CONFIG_HOME/pelta/registry.ini, else
    // $HOME/.config/pelta/registry.ini.
    static std::filesystem::path defaultPath();

    explicit ClassRegistry(std::filesystem::path file = defaultPath());

    std::vector<ClassEntry> entries() const;
    std::optional<ClassEntry> findProgId(std::string_view progId) const;  // without regard to case
    std::optional<ClassEntry> findClsid(const Guid& clsid) const;
    // Adds or replaces the entries of these class identifiers.
    void add(const std::vector<ClassEntry>& classes);
    // Removes exactly the entries of these class identifiers.
    void remove(const std::vector<Guid>& clsids);

    const std::filesystem::path& file() const noexcept { return file_; }

private:
    void rewrite(const std::function<void(std::vector<ClassEntry>&)>& change);
    std::filesystem::path file_;
};

// Creates an object by programmatic identifier: a local factory when one is
// registered in this process, else the registered library's class object.
// Raises CannotCreateObject naming the identifier or the library.
ObjectRef createObject(std::string_view progId);

// Factories of classes that live in this process, found before the registry.
void registerLocalClass(std::string_view progId, std::function<ObjectRef()> factory);
void unregisterLocalClass(std::string_view progId);

// Loads (once) the in-process server library at `path` and returns its entry
// point `symbol`; raises naming the library when it cannot.
void* serverEntryPoint(const std::string& path, const char* symbol);

// The server side, for libraries implementing the entry points.
struct ServerClass {
    const char* clsid;      // braced
    const char* name;       // object name; the programmatic identifier is Library.name
    ObjectRef (*create)();  // null while the class is not available
};

class InprocServer {
public:
    // `anchor` is any address inside the library, used to find its path.
    InprocServer(std::string libraryName, std::vector<ServerClass> classes, const void* anchor);

    HResult registerServer() const noexcept;
    HResult unregisterServer() const noexcept;
    HResult getClassObject(const Guid* clsid, ClassFactory** factory) const noexcept;
    // kOk when neither objects of the library (`liveObjects`, counted by the
    // library) nor class objects handed out are alive, else kFalse.
    HResult canUnloadNow(int64_t liveObjects) const noexcept;

    const std::string& libraryName() const noexcept { return libraryName_; }
    std::string libraryPath() const;
    std::vector<ClassEntry> classEntries() const;

private:
    std::string libraryName_;
    std::vector<ServerClass> classes_;
    const void* anchor_;
    mutable std::atomic<int64_t> factories_{0};
};

}  // namespace pelta
