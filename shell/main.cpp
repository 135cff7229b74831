// pelta: the host program of the library.
//   pelta [serve [OPTIONS]]     serve the library's screens to a web browser
//   pelta register [LIBRARY]    register the library's public objects
//   pelta unregister [LIBRARY]  remove them from the registry
//   pelta create PROGID         create an object by programmatic identifier
//   pelta smoke                 register, create the entry object, talk to it
#include <unistd.h>
#include <algorithm>
#include <filesystem>
#include <iostream>
#include <string>
#include <vector>

#include "platform/automation/error.h"
#include "platform/automation/registry.h"
#include "platform/automation/variant.h"
#include "shell/serve.h"

namespace fs = std::filesystem;

namespace {

fs::path selfDir() {
    std::error_code ec;
    auto p = fs::read_symlink("/proc/self/exe", ec);
    return ec ? fs::current_path() : p.parent_path();
}

// The library sits in ../lib beside the program's bin folder.
std::string defaultLibrary() {
    return (selfDir().parent_path() / "lib" / "libPeltaNom15.so").string();
}

int callEntry(const std::string& lib, const char* symbol) {
    auto fn = reinterpret_cast<pelta::HResult (*)()>(pelta::serverEntryPoint(lib, symbol));
    pelta::HResult hr = fn();
    if (hr != pelta::kOk) {
        std::cerr << symbol << " failed: 0x" << std::hex << static_cast<uint32_t>(hr) << "\n";
        return 1;
    }
    return 0;
}

int smoke(const std::string& lib) {
    if (int rc = callEntry(lib, "DllRegisterServer")) return rc;
    std::cout << "registered " << lib << " in " << pelta::ClassRegistry::defaultPath().string()
              << "\n";
    {
        pelta::ObjectRef dispatcher = pelta::createObject("PeltaNom15.cFormDispatcher");
        std::cout << "created " << dispatcher->typeName()
                  << ", LibName = " << pelta::getProperty(dispatcher.get(), "LibName").toString()
                  << "\n";
        pelta::Variant cancel(false);
        pelta::callByName(dispatcher.get(), "QueryTerminate", std::span(&cancel, 1));
        pelta::callByName(dispatcher.get(), "Terminate");
        std::cout << "terminated, cancel = " << cancel.toString() << "\n";
    }
    auto canUnload =
        reinterpret_cast<pelta::HResult (*)()>(pelta::serverEntryPoint(lib, "DllCanUnloadNow"));
    bool unloadable = canUnload() == pelta::kOk;
    std::cout << "DllCanUnloadNow: " << (unloadable ? "yes" : "no") << "\n";
    return unloadable ? 0 : 1;
}

}  // namespace

int main(int argc, char** argv) {
    std::string cmd = argc > 1 ? argv[1] : "serve";
    try {
        if (cmd == "serve") {
            std::string error;
            auto options = pelta::shell::parseServeOptions(
                std::vector<std::string>(argv + std::min(argc, 2), argv + argc), error);
            if (!options) {
                std::cerr << "pelta: " << error << "\nusage: " << pelta::shell::kServeUsage;
                return 2;
            }
            return pelta::shell::serve(*options);
        }
        if (cmd == "register" || cmd == "unregister") {
            std::string lib = argc > 2 ? argv[2] : defaultLibrary();
            return callEntry(lib, cmd == "register" ? "DllRegisterServer" : "DllUnregisterServer");
        }
        if (cmd == "create" && argc > 2) {
            pelta::ObjectRef o = pelta::createObject(argv[2]);
            std::cout << o->typeName() << "\n";
            try {
                std::cout << pelta::getProperty(o.get(), "LibName").toString() << "\n";
            } catch (const pelta::Error&) {
            }
            return 0;
        }
        if (cmd == "smoke") return smoke(argc > 2 ? argv[2] : defaultLibrary());
        std::cerr
            << "usage: pelta [serve [OPTIONS]] | register|unregister [LIBRARY] | create PROGID"
               " | smoke\n       "
            << pelta::shell::kServeUsage;
        return 2;
    } catch (const pelta::Error& e) {
        std::cerr << "pelta: error " << e.number() << ": " << e.description() << "\n";
        return 1;
    }
}
