#include "shell/serve.h"

#include <pthread.h>
#include <signal.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iostream>
#include <thread>

#include "bll/database.h"
#include "bll/service.h"
#include "platform/automation/error.h"
#include "platform/automation/registry.h"
#include "shell/api.h"
#include "shell/framework_screens.h"
#include "shell/http_server.h"
#include "shell/library_host.h"
#include "shell/log.h"
#include "shell/session.h"

namespace fs = std::filesystem;

namespace pelta::shell {

namespace {

bool parseNumber(const std::string& text, int lo, int hi, int& out) {
    if (text.empty() || text.size() > 9) return false;
    int v = 0;
    for (char c : text) {
        if (c < '0' || c > '9') return false;
        v = v * 10 + (c - '0');
    }
    if (v < lo || v > hi) return false;
    out = v;
    return true;
}

fs::path selfDir() {
    std::error_code ec;
    auto p = fs::read_symlink("/proc/self/exe", ec);
    return ec ? fs::current_path() : p.parent_path();
}

std::string env(const char* name) {
    const char* v = std::getenv(name);
    return v ? v : "";
}

std::string defaultWebRoot() {
    if (std::string e = env("PELTA_WEB_DIR"); !e.empty()) return e;
    fs::path installed = selfDir().parent_path() / "share" / "pelta" / "web";
    if (fs::exists(installed / "index.html")) return installed.string();
#ifdef PELTA_WEB_DIST
    return PELTA_WEB_DIST;
#else
    return installed.string();
#endif
}

}  // namespace

std::optional<ServeOptions> parseServeOptions(const std::vector<std::string>& args,
                                              std::string& error) {
    ServeOptions o;
    o.webRoot = defaultWebRoot();
    o.library = (selfDir().parent_path() / "lib" / "libPeltaNom15.so").string();
    for (size_t i = 0; i < args.size(); ++i) {
        const std::string& a = args[i];
        auto value = [&](std::string& out) {
            if (i + 1 >= args.size()) {
                error = a + " needs a value";
                return false;
            }
            out = args[++i];
            return true;
        };
        std::string v;
        if (a == "--db") {
            if (!value(o.database)) return std::nullopt;
        } else if (a == "--address") {
            if (!value(o.address)) return std::nullopt;
            if (o.address.empty()) {
                error = "--address is empty";
                return std::nullopt;
            }
        } else if (a == "--port") {
            if (!value(v)) return std::nullopt;
            if (!parseNumber(v, 0, 65535, o.port)) {
                error = "--port must be a number from 0 to 65535";
                return std::nullopt;
            }
        } else if (a == "--web") {
            if (!value(o.webRoot)) return std::nullopt;
        } else if (a == "--library") {
            if (!value(o.library)) return std::nullopt;
        } else if (a == "--session-timeout") {
            if (!value(v)) return std::nullopt;
            if (!parseNumber(v, 1, 86400, o.sessionTimeoutSeconds)) {
                error = "--session-timeout must be 1 to 86400 seconds";
                return std::nullopt;
            }
            o.heartbeatSeconds =
                std::min(o.heartbeatSeconds, std::max(1, o.sessionTimeoutSeconds / 3));
        } else {
            error = "unknown option " + a;
            return std::nullopt;
        }
    }
    return o;
}

bool isLoopback(const std::string& a) {
    return a == "localhost" || a == "::1" || a == "[::1]" || a.rfind("127.", 0) == 0;
}

std::string defaultDemoDatabase() {
    fs::path base;
    if (std::string x = env("XDG_DATA_HOME"); !x.empty())
        base = x;
    else if (std::string h = env("HOME"); !h.empty())
        base = fs::path(h) / ".local" / "share";
    else
        base = fs::current_path();
    return (base / "pelta" / "demo.db").string();
}

int serve(const ServeOptions& o) {
    ApiOptions apiOptions;
    apiOptions.version = "15.0";
    apiOptions.requireLogin = !isLoopback(o.address);
    if (apiOptions.requireLogin) {
        apiOptions.password = env("PELTA_SHELL_PASSWORD");
        if (apiOptions.password.size() < 8) {
            std::cerr << "pelta: listening on " << o.address
                      << " needs a login: set PELTA_SHELL_PASSWORD (8 characters or more)\n";
            return 2;
        }
    }

    // The database: the one named, else the demo database in the data folder,
    // created and filled when missing.
    std::string database = o.database.empty() ? defaultDemoDatabase() : o.database;
    try {
        std::error_code ec;
        if (o.database.empty() && !fs::exists(database, ec)) {
            fs::create_directories(fs::path(database).parent_path(), ec);
            logLine("creating the demo database " + database);
            pelta::bll::createDemoDatabase(database);
        }
        pelta::bll::openDatabase(database);  // brings its schema up to date
    } catch (const pelta::Error& e) {
        std::cerr << "pelta: cannot open the database " << database << ": " << e.description()
                  << "\n";
        return 1;
    }
    apiOptions.database = database;
    logLine("database " + database);
    if (apiOptions.requireLogin) {
        apiOptions.userExists = [database](const std::string& user) {
            try {
                pelta::bll::Connection::open(database,
                                             user);  // raises for unknown or inactive users
                return true;
            } catch (const pelta::Error&) {
                return false;
            }
        };
    }

    // Threads started from here on block the stop signals; the main thread waits for them.
    sigset_t stopSignals;
    sigemptyset(&stopSignals);
    sigaddset(&stopSignals, SIGINT);
    sigaddset(&stopSignals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &stopSignals, nullptr);
    signal(SIGPIPE, SIG_IGN);  // a closed tab is an ordinary failed write

    // The framework first: the library looks for its services once.
    FrameworkOptions frameworkOptions;
    frameworkOptions.database = database;
    ListAdapterFactory adapter = frameworkListAdapter(frameworkOptions);
    LibraryHost library(o.library);
    apiOptions.library = library.libraryFile();
    library.setListAdapter(std::move(adapter));

    SessionOptions sessionOptions;
    sessionOptions.idleTimeout = std::chrono::seconds(o.sessionTimeoutSeconds);
    SessionManager sessions(library, sessionOptions);
    Api api(sessions, apiOptions);

    HttpOptions httpOptions;
    httpOptions.address = o.address;
    httpOptions.port = o.port;
    httpOptions.webRoot = o.webRoot;
    httpOptions.heartbeat = std::chrono::seconds(o.heartbeatSeconds);
    HttpServer http(api, httpOptions);
    int port = http.bind();
    std::string host = o.address.find(':') != std::string::npos && o.address.front() != '['
                           ? "[" + o.address + "]"
                           : o.address;
    std::cout << "pelta: serving on http://" << host << ":" << port << "/" << std::endl;
    std::thread listener([&] { http.run(); });

    int received = 0;
    sigwait(&stopSignals, &received);
    logLine("stopping");
    sessions.releaseAll();  // ends every event stream and terminates the screens
    http.stop();
    listener.join();
    // Every screen terminated released its objects: the library may unload.
    try {
        auto canUnload = reinterpret_cast<pelta::HResult (*)()>(
            pelta::serverEntryPoint(library.libraryFile(), "DllCanUnloadNow"));
        std::cout << "library objects released: " << (canUnload() == pelta::kOk ? "yes" : "no")
                  << std::endl;
    } catch (const pelta::Error&) {
    }
    return 0;
}

}  // namespace pelta::shell
