// Shared pieces of the library-frame tests: a scratch folder for logs and
// debugger output, a host application that records what the library asks of
// it, and a small form class.
#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <vector>

#include "library/contracts/Constants.h"
#include "library/contracts/Framework.h"
#include "library/contracts/IZonTerminate.h"
#include "library/frame/Forms.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "platform/automation/registry.h"

namespace frametest {

namespace fs = std::filesystem;

inline std::string readFile(const fs::path& p) {
    std::ifstream in(p, std::ios::binary);
    std::ostringstream s;
    s << in.rdbuf();
    return s.str();
}

inline std::vector<std::string> lines(const std::string& text) {
    std::vector<std::string> r;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line))
        r.push_back(line);
    return r;
}

// Points the error logs and the debugger output into a fresh folder, with
// debugger output switched on or off.
class ScratchFolder {
public:
    explicit ScratchFolder(bool debug = true) {
        char tmpl[] = "/tmp/pelta_frame_XXXXXX";
        dir_ = ::mkdtemp(tmpl);
        logs_ = dir_ / "logs";
        ::setenv("PELTA_LOG_FOLDER", logs_.c_str(), 1);
        ::setenv("PELTA_DEBUG_OUTPUT", (dir_ / "debug.txt").c_str(), 1);
        if (debug)
            ::setenv("_ZON_PELTA_DEBUG", "1", 1);
        else
            ::unsetenv("_ZON_PELTA_DEBUG");
        PeltaNom15::mdErrorHandling::ReloadDebugSwitch();
    }
    ~ScratchFolder() {
        ::unsetenv("PELTA_LOG_FOLDER");
        ::unsetenv("PELTA_DEBUG_OUTPUT");
        ::unsetenv("_ZON_PELTA_DEBUG");
        PeltaNom15::mdErrorHandling::ReloadDebugSwitch();
        std::error_code ec;
        fs::remove_all(dir_, ec);
    }
    const fs::path& logs() const { return logs_; }
    std::string debugText() const { return readFile(dir_ / "debug.txt"); }
    // The log files written so far.
    std::vector<fs::path> logFiles() const {
        std::vector<fs::path> r;
        std::error_code ec;
        for (auto& e : fs::directory_iterator(logs_, ec))
            r.push_back(e.path());
        return r;
    }
    // The text of the one log file (fails the test when there is not exactly one).
    std::string logText() const {
        auto files = logFiles();
        EXPECT_EQ(files.size(), 1u);
        return files.empty() ? std::string() : readFile(files.front());
    }

private:
    fs::path dir_;
    fs::path logs_;
};

// A host application recording the library's requests, registered as the
// framework services for the lifetime of the object.
class RecordingHost final : public PeltaNom15::IFrameworkServices,
                            public PeltaNom15::IHostApplication,
                            public PeltaNom15::IDebugConsole,
                            public PeltaNom15::IHostLogger {
public:
    struct Box {
        std::string Text;
        int32_t Style;
        std::string Caption;
        std::string Details;
    };

    // Scripted behaviour.
    std::string logName;
    int32_t hookAnswer = 0;
    bool offerLogger = false;
    bool offerConsole = false;
    std::vector<int32_t> answers;  // message-box answers, in order

    // What the library did.
    std::vector<Box> boxes;
    std::vector<std::string> hooked;  // locations offered to the error hook
    std::string openedFile;
    std::vector<std::string> printed;
    std::map<std::string, std::string> instances;
    int refreshes = 0;
    int32_t pointer = 11;
    std::vector<int32_t> pointerHistory;

    // IFrameworkServices
    pelta::Ref<PeltaNom15::IHostApplication> HostApplication() override { return this; }
    int32_t MsgBox(const std::string& Text, int32_t Style, const std::string& Caption,
                   const std::string& Details) override {
        boxes.push_back({Text, Style, Caption, Details});
        if (answers.empty()) return PeltaNom15::vbOK;
        int32_t a = answers.front();
        answers.erase(answers.begin());
        return a;
    }
    pelta::ObjectRef CreateObject(const std::string& ProgID) override {
        try {
            return pelta::createObject(ProgID);
        } catch (...) {
            return {};
        }
    }
    pelta::Ref<PeltaNom15::IRecordDeletion> RecordDeletion() override { return {}; }
    int32_t MousePointer() override { return pointer; }
    void SetMousePointer(int32_t Pointer) override {
        pointer = Pointer;
        pointerHistory.push_back(Pointer);
    }
    bool ShowSelector(pelta::Object*, const std::string&, pelta::Variant&) override {
        return false;  // a host that shows no lists
    }

    // IHostApplication
    std::string LogName() override { return logName; }
    int32_t ErrorHook(int32_t, const std::string&, const std::string&,
                      const std::string& Location) override {
        hooked.push_back(Location);
        return hookAnswer;
    }
    pelta::Ref<PeltaNom15::IHostLogger> Logger() override {
        return offerLogger ? pelta::Ref<PeltaNom15::IHostLogger>(this) : nullptr;
    }
    pelta::Ref<PeltaNom15::IDebugConsole> DebugConsole() override {
        return offerConsole ? pelta::Ref<PeltaNom15::IDebugConsole>(this) : nullptr;
    }
    pelta::ObjectRef CreateForm(const std::string& ProgID) override { return CreateObject(ProgID); }
    pelta::Variant Option(const std::string&) override { return {}; }

    // IDebugConsole
    int32_t NextInstanceID() override { return ++nextId_; }
    bool AddInstance(const std::string& Key, const std::string& Description) override {
        return instances.emplace(Key, Description).second;
    }
    bool RemoveInstance(const std::string& Key) override { return instances.erase(Key) != 0; }
    int32_t InstanceCount() override { return static_cast<int32_t>(instances.size()); }
    void RefreshConsole() override { ++refreshes; }

    // IHostLogger
    bool Open(const std::string& FileName) override {
        openedFile = FileName;
        return true;
    }
    void Print(const std::string& Line) override { printed.push_back(Line); }
    int64_t Length() override { return static_cast<int64_t>(printed.size()); }
    void Close() override {}

    std::string typeName() const override { return "RecordingHost"; }

private:
    int32_t nextId_ = 100;
};

// Installs a RecordingHost as the framework for one test.
class HostInstall {
public:
    HostInstall() : host_(pelta::makeRef<RecordingHost>()) {
        auto host = host_;
        pelta::registerLocalClass(PeltaNom15::kProgIdFrameworkServices,
                                  [host] { return pelta::ObjectRef(host); });
        PeltaNom15::ResetFrameworkServices();
    }
    ~HostInstall() {
        pelta::unregisterLocalClass(PeltaNom15::kProgIdFrameworkServices);
        PeltaNom15::ResetFrameworkServices();
    }
    RecordingHost& operator*() const { return *host_; }
    RecordingHost* operator->() const { return host_.get(); }

private:
    pelta::Ref<RecordingHost> host_;
};

// A form that writes what happens to it into a shared journal.
class JournalForm final : public PeltaNom15::LibForm, public PeltaNom15::IZonTerminate {
public:
    JournalForm(std::string name, std::vector<std::string>* journal)
        : name_(std::move(name)), journal_(journal) {}

    bool refuseTerminate = false;
    bool refuseUnload = false;

    void QueryTerminate(bool& Cancel) override {
        if (journal_) journal_->push_back(name_ + (Cancel ? " abandoned" : " asked"));
        if (!Cancel && refuseTerminate) Cancel = true;
    }
    void Terminate() override {
        if (journal_) journal_->push_back(name_ + " terminated");
    }
    std::string typeName() const override { return name_; }

protected:
    void Form_Unload(bool& Cancel) override {
        if (journal_) journal_->push_back(name_ + " unloaded");
        Cancel = refuseUnload;
    }

private:
    std::string name_;
    std::vector<std::string>* journal_;
};

// Registers a creator for one class name and puts the previous one back.
class ScopedClass {
public:
    ScopedClass(std::string name, PeltaNom15::ClassCreator creator) : name_(std::move(name)) {
        previous_ = PeltaNom15::RegisterFormClass(name_, std::move(creator));
    }
    ~ScopedClass() { PeltaNom15::RegisterFormClass(name_, previous_); }

private:
    std::string name_;
    PeltaNom15::ClassCreator previous_;
};

// Keeps the registry of classes away from the user's own.
class IsolatedRegistry : public ::testing::Environment {
public:
    void SetUp() override {
        ::setenv("PELTA_REGISTRY", "/nonexistent/pelta-frame-tests/registry.ini", 1);
        PeltaNom15::ResetFrameworkServices();
    }
};

}  // namespace frametest
