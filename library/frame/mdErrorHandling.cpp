#include "library/frame/mdErrorHandling.h"

#include <dlfcn.h>
#include <sys/resource.h>
#include <sys/utsname.h>
#include <unistd.h>

#include <chrono>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <filesystem>
#include <fstream>
#include <map>
#include <new>
#include <sstream>
#include <stdexcept>

#include "library/contracts/Constants.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdGlobals.h"
#include "library/frame/mdNomGlobals.h"
#include "platform/automation/error.h"
#include "platform/automation/registry.h"

namespace PeltaNom15 {
namespace mdErrorHandling {

namespace {

namespace fs = std::filesystem;

constexpr const char* kUnexpectedMarker = "Непредвидено изключение:";
constexpr const char* kStackWalkProgID = "ZonStackWalk.Symbols";  // optional component

const char kAnchor = 0;  // an address inside the library, to find its folder
const auto g_tLoaded = std::chrono::steady_clock::now();

thread_local ErrorInfo t_oSaved;

std::string hex(int32_t n) {
    char buf[16];
    std::snprintf(buf, sizeof buf, "%X", static_cast<uint32_t>(n));
    return buf;
}

int64_t threadNumber() {
    return static_cast<int64_t>(gettid());
}

// Seconds since the library was loaded, "0.000".
std::string secondsSinceLoad() {
    std::chrono::duration<double> d = std::chrono::steady_clock::now() - g_tLoaded;
    char buf[32];
    std::snprintf(buf, sizeof buf, "%.3f", d.count());
    return buf;
}

struct LocalNow {
    std::tm tm{};
    int ms = 0;
};

LocalNow localNow() {
    auto now = std::chrono::system_clock::now();
    std::time_t t = std::chrono::system_clock::to_time_t(now);
    LocalNow r;
    localtime_r(&t, &r.tm);
    r.ms = static_cast<int>(
        std::chrono::duration_cast<std::chrono::milliseconds>(now.time_since_epoch()).count() %
        1000);
    return r;
}

std::string formatTm(const std::tm& tm, const char* pattern) {
    char buf[64];
    std::strftime(buf, sizeof buf, pattern, &tm);
    return buf;
}

bool startsWith(std::string_view s, std::string_view p) {
    return s.substr(0, p.size()) == p;
}

// Continuation lines indented by two tabs.
std::string indentLines(const std::string& text) {
    std::string r;
    r.reserve(text.size());
    for (size_t i = 0; i < text.size(); ++i) {
        char c = text[i];
        if (c == '\r' && i + 1 < text.size() && text[i + 1] == '\n') continue;
        r += c;
        if (c == '\n') r += "\t\t";
    }
    while (!r.empty() && (r.back() == '\t' || r.back() == '\n'))
        r.pop_back();
    return r;
}

bool isBlank(const std::string& s) {
    return s.find_first_not_of(" \t\r\n") == std::string::npos;
}

// A line of `description` that is "Pelta:" alone: the error was logged before.
bool loggedBefore(const std::string& description) {
    std::istringstream in(description);
    std::string line;
    while (std::getline(in, line)) {
        if (!line.empty() && line.back() == '\r') line.pop_back();
        if (line == "Pelta:") return true;
    }
    return false;
}

std::string libraryPath() {
    Dl_info info{};
    if (dladdr(&kAnchor, &info) && info.dli_fname) return info.dli_fname;
    return {};
}

std::string readFirstLine(const fs::path& p) {
    std::ifstream in(p);
    std::string line;
    std::getline(in, line);
    while (!line.empty() && (line.back() == '\n' || line.back() == '\r' || line.back() == ' '))
        line.pop_back();
    return line;
}

std::string collapseSpaces(const std::string& s) {
    std::string r;
    for (char c : s) {
        if (c == '\t') c = ' ';
        if (c == ' ' && (r.empty() || r.back() == ' ')) continue;
        r += c;
    }
    while (!r.empty() && r.back() == ' ')
        r.pop_back();
    return r;
}

// "key: value" of a /proc file.
std::string procValue(const char* file, const std::string& key) {
    std::ifstream in(file);
    std::string line;
    while (std::getline(in, line)) {
        if (line.compare(0, key.size(), key) == 0) {
            auto colon = line.find(':');
            if (colon != std::string::npos) return collapseSpaces(line.substr(colon + 1));
        }
    }
    return {};
}

std::string fixed2(double v) {
    char buf[32];
    std::snprintf(buf, sizeof buf, "%.2f", v);
    return buf;
}

// One line of system facts: operating system, processor, memory, machine,
// and this process's memory and processor time.
std::string systemFacts() {
    std::string os;
    {
        std::ifstream in("/etc/os-release");
        std::string line;
        while (std::getline(in, line)) {
            if (startsWith(line, "PRETTY_NAME=")) {
                os = line.substr(12);
                if (os.size() >= 2 && os.front() == '"') os = os.substr(1, os.size() - 2);
            }
        }
    }
    utsname u{};
    if (uname(&u) == 0) {
        if (os.empty()) os = u.sysname;
        os += std::string(" ") + u.release;
    }
    std::string cpu = procValue("/proc/cpuinfo", "model name");
    double totalKb = std::atof(procValue("/proc/meminfo", "MemTotal").c_str());
    std::string maker = readFirstLine("/sys/class/dmi/id/sys_vendor");
    std::string model = readFirstLine("/sys/class/dmi/id/product_name");
    double rssKb = std::atof(procValue("/proc/self/status", "VmRSS").c_str());
    rusage ru{};
    getrusage(RUSAGE_SELF, &ru);
    double user = ru.ru_utime.tv_sec + ru.ru_utime.tv_usec / 1e6;
    double kernel = ru.ru_stime.tv_sec + ru.ru_stime.tv_usec / 1e6;
    std::string r = os + ", " + cpu + ", " + fixed2(totalKb / 1024.0 / 1024.0) + " GB, " +
                    collapseSpaces(maker + " " + model) + ", Mem " + fixed2(rssKb / 1024.0) +
                    " MB, User " + fixed2(user) + ", Kernel " + fixed2(kernel);
    // The process has no graphics or window objects of its own here.
    r += ", GUI 0/0";
    return r;
}

std::string buildLine() {
#ifdef NDEBUG
    const char* kind = "Release";
#else
    const char* kind = "Debug";
#endif
    return std::string(kLibName) + " 15.0 Build 0 (" + kind + ", " + libraryPath() + ")";
}

// The error to handle: the given one, else the exception in flight, else the
// one saved last.
ErrorInfo resolve(const ErrorInfo* error) {
    if (error) return *error;
    if (auto e = std::current_exception()) return ErrorFromException(e);
    return t_oSaved;
}

// ---- the instance register kept by the library ----------------------------
struct LocalRegister {
    int32_t next = 0;
    std::map<std::string, std::string> entries;
};
LocalRegister& localRegister() {
    static auto* s = new LocalRegister();
    return *s;
}

// ---- the debug switch -------------------------------------------------------
bool readDebugSwitch() {
    const char* v = std::getenv("_ZON_PELTA_DEBUG");
    if (!v || !*v) return false;
    return C2Dbl(pelta::Variant(std::string(v))) != 0.0;
}
bool& debugSwitch() {
    static bool s = readDebugSwitch();
    return s;
}

}  // namespace

ErrorInfo ErrorFromException(std::exception_ptr Exception) {
    ErrorInfo r;
    if (!Exception) return r;
    try {
        std::rethrow_exception(Exception);
    } catch (const pelta::Error& e) {
        r = {e.number(), e.source(), e.description(), e.line()};
    } catch (const std::bad_alloc&) {
        r = {pelta::errc::OutOfMemory, {}, pelta::describeError(pelta::errc::OutOfMemory), 0};
    } catch (const std::out_of_range& e) {
        r = {pelta::errc::SubscriptOutOfRange, {}, e.what(), 0};
    } catch (const std::invalid_argument& e) {
        r = {pelta::errc::InvalidProcedureCall, {}, e.what(), 0};
    } catch (const std::exception& e) {
        r = {pelta::errc::Fail, {}, e.what(), 0};
    } catch (...) {
        r = {pelta::errc::Fail, {}, std::string(kUnexpectedMarker) + " unknown exception", 0};
    }
    return r;
}

ErrorInfo PushError() {
    if (auto e = std::current_exception()) t_oSaved = ErrorFromException(e);
    return t_oSaved;
}

void PopError() {}

void PopError(const ErrorInfo& Error) {
    t_oSaved = Error;
}

const ErrorInfo& SavedError() {
    return t_oSaved;
}

std::string ComputerName(bool WithSession) {
    static const std::string s_host = [] {
        char buf[256] = {};
        if (gethostname(buf, sizeof buf - 1) != 0) return std::string("localhost");
        return std::string(buf);
    }();
    static const std::string s_session = []() -> std::string {
        const char* ssh = std::getenv("SSH_CONNECTION");
        if (!ssh || !*ssh) ssh = std::getenv("SSH_CLIENT");
        if (!ssh || !*ssh) return {};
        const char* id = std::getenv("XDG_SESSION_ID");
        if (id && *id) return id;
        return std::to_string(static_cast<long>(getsid(0)));
    }();
    if (WithSession && !s_session.empty()) return s_host + ":" + s_session;
    return s_host;
}

std::string FormatLocation(const std::string& Object, const std::string& Procedure, int32_t Line) {
    std::string r = "[" + ComputerName() + "] " + kLibName + "." + Object;
    if (!Procedure.empty()) r += "." + Procedure;
    if (Line != 0) r += "(" + std::to_string(Line) + ")";
    return r;
}

bool DebugEnabled() {
    return debugSwitch();
}

void ReloadDebugSwitch() {
    debugSwitch() = readDebugSwitch();
}

void DebugOutput(const std::string& Text) {
    if (!DebugEnabled()) return;
    try {
        const char* target = std::getenv("PELTA_DEBUG_OUTPUT");
        if (target && *target) {
            if (FILE* f = std::fopen(target, "ab")) {
                std::fwrite(Text.data(), 1, Text.size(), f);
                std::fclose(f);
            }
        } else {
            std::fwrite(Text.data(), 1, Text.size(), stderr);
            std::fflush(stderr);
        }
    } catch (...) {
    }
}

int32_t OfferErrorHook(const ErrorInfo& Error, const std::string& Location) {
    try {
        if (auto host = HostApplication())
            return host->ErrorHook(Error.Number, Error.Source, Error.Description, Location);
    } catch (...) {
    }
    return 0;
}

std::string LogFolder() {
    try {
        if (const char* env = std::getenv("PELTA_LOG_FOLDER"); env && *env) {
            std::error_code ec;
            fs::create_directories(env, ec);
            return env;
        }
        std::error_code ec;
        std::string lib = libraryPath();
        if (!lib.empty()) {
            fs::path dir = fs::absolute(fs::path(lib), ec).parent_path();
            for (const fs::path& candidate : {dir / ".." / "Logs", dir / ".." / ".." / "Logs"}) {
                if (fs::is_directory(candidate, ec)) return fs::weakly_canonical(candidate, ec);
            }
            fs::path own = dir / "Logs";
            fs::create_directories(own, ec);
            if (fs::is_directory(own, ec)) return own;
        }
        fs::path temp = fs::temp_directory_path(ec) / "PeltaLogs";
        fs::create_directories(temp, ec);
        return temp;
    } catch (...) {
        return "/tmp";
    }
}

std::string LogFileName(const std::string& HostLogName) {
    std::string name = "Errors_" + ComputerName(false) + "_";
    if (!HostLogName.empty()) name += HostLogName + "_";
    return name + formatTm(localNow().tm, "%Y_%m_%d") + ".log";
}

LogFileHandle LogFileOpen(const std::string& FileName, bool Unexpected) {
    LogFileHandle h;
    try {
        if (!Unexpected) {
            if (auto host = HostApplication()) {
                if (auto logger = host->Logger()) {
                    if (logger->Open(FileName)) h.Logger = logger;
                }
            }
        }
        if (!h.Logger) h.File = std::fopen(FileName.c_str(), "ab");
        if (h && LogFileLOF(h) == 0) {
            LogFilePrint(h, "Logging started on " + formatTm(localNow().tm, "%Y.%m.%d %H:%M:%S"));
            LogFilePrint(h, buildLine());
            LogFilePrint(h, systemFacts());
        }
    } catch (...) {
    }
    return h;
}

void LogFilePrint(LogFileHandle& File, const std::string& Text) {
    try {
        if (File.Logger) {
            File.Logger->Print(Text);
        } else if (File.File) {
            auto* f = static_cast<FILE*>(File.File);
            std::fwrite(Text.data(), 1, Text.size(), f);
            std::fputc('\n', f);
        }
    } catch (...) {
    }
}

int64_t LogFileLOF(LogFileHandle& File) {
    try {
        if (File.Logger) return File.Logger->Length();
        if (File.File) {
            auto* f = static_cast<FILE*>(File.File);
            std::fflush(f);
            long pos = std::ftell(f);
            if (std::fseek(f, 0, SEEK_END) == 0) pos = std::ftell(f);
            return pos < 0 ? 0 : pos;
        }
    } catch (...) {
    }
    return 0;
}

void LogFileClose(LogFileHandle& File) {
    try {
        if (File.Logger) File.Logger->Close();
        if (File.File) std::fclose(static_cast<FILE*>(File.File));
    } catch (...) {
    }
    File.Logger.reset();
    File.File = nullptr;
}

void LogError(int32_t Number, const std::string& Description, const std::string& Location,
              const std::string& Source, const std::string& StackText, bool Unexpected) {
    try {
        const std::string prefix = std::to_string(threadNumber()) + " " + secondsSinceLoad();
        if (Number == 0) {
            DebugOutput(prefix + ": " + Description + " [" + Location + "]\n");
            return;
        }
        std::string callStack = Location;
        if (!Source.empty()) callStack += "\n" + Source;
        DebugOutput(prefix + ": Error: " + Description + " [" + Location + "]\n");
        if (loggedBefore(Description)) return;
        if (Description.find(kUnexpectedMarker) != std::string::npos) Unexpected = true;

        std::string stack = StackText;
        if (stack.empty()) {
            try {
                pelta::ObjectRef walker = pelta::createObject(kStackWalkProgID);
                stack = C2Str(pelta::callByName(walker.get(), "GetCallStack"));
            } catch (...) {
                stack.clear();
            }
        }

        std::string hostLogName;
        try {
            if (auto host = HostApplication()) hostLogName = host->LogName();
        } catch (...) {
        }
        const std::string file = (fs::path(LogFolder()) / LogFileName(hostLogName)).string();

        LocalNow now = localNow();
        // The milliseconds as the last four characters of the timer, "0.000".
        char ms[8];
        std::snprintf(ms, sizeof ms, ".%03d", now.ms);
        const std::string separator =
            "= " + formatTm(now.tm, "%Y.%m.%d %H:%M:%S") + ms + " " + std::to_string(getpid()) +
            " 0x" + hex(static_cast<int32_t>(threadNumber())) + " " + std::string(53, '=');

        LogFileHandle h = LogFileOpen(file, Unexpected);
        if (!h) return;
        LogFilePrint(h, "");
        LogFilePrint(h, separator);
        LogFilePrint(h, "");
        LogFilePrint(h, "Error:\t\t&H" + hex(Number));
        LogFilePrint(h, "Description:\t" + indentLines(Description));
        LogFilePrint(h, "Call stack:\t" + indentLines(callStack));
        if (!isBlank(stack)) LogFilePrint(h, "PDB call stack:\t" + indentLines(stack));
        LogFileClose(h);
    } catch (...) {
    }
}

ShownError ComposeShownError(const ErrorInfo& Error, const std::string& Location) {
    if (startsWith(Error.Description, "Pelta: ")) return {Error.Description.substr(7), {}};
    return {Error.Description,
            "Call stack:\n" + Location + "\n" + Error.Source + "\n0x" + hex(Error.Number)};
}

void PrintError(const std::string& Procedure, const std::string& Object, const ErrorInfo* Error) {
    try {
        ErrorInfo e = resolve(Error);
        if (Error) PopError(*Error);
        LogError(e.Number, e.Description, FormatLocation(Object, Procedure, e.Line), e.Source);
    } catch (...) {
    }
}

void RaiseError(const std::string& Procedure, const std::string& Object, const ErrorInfo* Error) {
    ErrorInfo e;
    std::string location;
    try {
        e = resolve(Error);
        location = FormatLocation(Object, Procedure, e.Line);
        LogError(e.Number, e.Description, location, e.Source);
    } catch (...) {
    }
    throw pelta::Error(e.Number, e.Source, e.Description, e.Line).withLocation(location);
}

int32_t ShowError(const std::string& Procedure, const std::string& Object,
                  const std::string& Caption, const ErrorInfo* Error) {
    try {
        ErrorInfo e = resolve(Error);
        const std::string location = FormatLocation(Object, Procedure, e.Line);
        LogError(e.Number, e.Description, location, e.Source);
        auto services = FrameworkServices();
        if (!services) return 0;
        ShownError shown = ComposeShownError(e, location);
        int32_t pointer = services->MousePointer();
        services->SetMousePointer(0);
        int32_t answer = 0;
        try {
            answer = services->MsgBox(shown.Message, vbCritical | vbAbortRetryIgnore, Caption,
                                      shown.Details);
        } catch (...) {
        }
        services->SetMousePointer(pointer);
        return answer;
    } catch (...) {
        return 0;
    }
}

void DebugInstanceInit(const std::string& ClassName, int32_t& ID, const void* Address) {
    try {
        pelta::Ref<IDebugConsole> console;
        try {
            if (auto host = HostApplication()) console = host->DebugConsole();
        } catch (...) {
        }
        auto& local = localRegister();
        const bool twice = ID != 0;
        if (!twice) ID = console ? console->NextInstanceID() : ++local.next;
        char address[32];
        std::snprintf(address, sizeof address, "%llX",
                      static_cast<unsigned long long>(reinterpret_cast<uintptr_t>(Address)));
        const std::string key = std::to_string(ID);
        const std::string entry = key + "|" + formatTm(localNow().tm, "%H:%M:%S") + "|&H" +
                                  address + "|" + kLibName + "." + ClassName;
        bool added =
            console ? console->AddInstance(key, entry) : local.entries.emplace(key, entry).second;
        if (!added)
            DebugOutput(std::string(kLibName) + "." + ClassName + " " + key +
                        " Init (This should not happen)\n");
        if (console) console->RefreshConsole();
    } catch (...) {
    }
}

void DebugInstanceTerm(const std::string& ClassName, int32_t& ID) {
    try {
        pelta::Ref<IDebugConsole> console;
        try {
            if (auto host = HostApplication()) console = host->DebugConsole();
        } catch (...) {
        }
        auto& local = localRegister();
        const int32_t count =
            console ? console->InstanceCount() : static_cast<int32_t>(local.entries.size());
        if (count == 0) {
            DebugOutput("DebugIDs collection is empty\n");
        } else {
            const std::string key = std::to_string(ID);
            if (console) {
                console->RemoveInstance(key);
                console->RefreshConsole();
            } else {
                local.entries.erase(key);
            }
        }
        ID = 0;
    } catch (...) {
    }
}

int32_t LocalInstanceCount() {
    return static_cast<int32_t>(localRegister().entries.size());
}

}  // namespace mdErrorHandling

int32_t PrintError(const std::string& Procedure, const std::string& Object,
                   const ErrorInfo* Error) {
    ErrorInfo e = Error ? *Error : mdErrorHandling::PushError();
    int32_t answer = mdErrorHandling::OfferErrorHook(
        e, mdErrorHandling::FormatLocation(Object, Procedure, e.Line));
    if (answer != kErrorHookRetry) mdErrorHandling::PrintError(Procedure, Object, &e);
    return answer;
}

int32_t RaiseError(const std::string& Procedure, const std::string& Object,
                   const ErrorInfo* Error) {
    ErrorInfo e = Error ? *Error : mdErrorHandling::PushError();
    int32_t answer = mdErrorHandling::OfferErrorHook(
        e, mdErrorHandling::FormatLocation(Object, Procedure, e.Line));
    if (answer == kErrorHookRetry) return answer;
    mdErrorHandling::RaiseError(Procedure, Object, &e);
}

int32_t ShowError(const std::string& Procedure, const std::string& Object,
                  const std::string& Caption, const ErrorInfo* Error) {
    return mdErrorHandling::ShowError(Procedure, Object, Caption, Error);
}

}  // namespace PeltaNom15
