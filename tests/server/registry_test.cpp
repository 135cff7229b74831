// The library as an in-process server: registration in a registry file,
// creation by programmatic identifier in another process, unregistration that
// removes exactly the library's entries.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>

#include "platform/automation/error.h"
#include "platform/automation/registry.h"
#include "platform/automation/variant.h"

namespace fs = std::filesystem;

namespace {

class RegistryFile : public ::testing::Test {
protected:
    void SetUp() override {
        dir_ = fs::temp_directory_path() /
               ("pelta-registry-" + std::to_string(::getpid()) + "-" +
                ::testing::UnitTest::GetInstance()->current_test_info()->name());
        fs::remove_all(dir_);
        fs::create_directories(dir_);
        file_ = dir_ / "registry.ini";
        ::setenv("PELTA_REGISTRY", file_.c_str(), 1);
    }
    void TearDown() override {
        ::unsetenv("PELTA_REGISTRY");
        fs::remove_all(dir_);
    }
    static std::string run(const std::string& cmd, int& status) {
        std::string out;
        FILE* p = ::popen(cmd.c_str(), "r");
        char buf[512];
        while (p && std::fgets(buf, sizeof buf, p))
            out += buf;
        status = p ? ::pclose(p) : -1;
        return out;
    }
    fs::path dir_, file_;
};

TEST_F(RegistryFile, RegisterCreateInAnotherProcessAndUnregister) {
    // An entry of some other library must survive our unregistration.
    pelta::ClassRegistry reg(file_);
    auto other = pelta::Guid::generate();
    reg.add({{other, "PeltaTrade15.ctxInvDocuments", "/opt/other/libPeltaTrade15.so"}});

    int status = 0;
    std::string out = run(std::string(PELTA_TOOL_FILE) + " register " + PELTA_LIBRARY_FILE, status);
    ASSERT_EQ(status, 0) << out;

    auto entries = reg.entries();
    ASSERT_EQ(entries.size(), 19u);  // 18 public objects and the foreign one
    auto items = reg.findProgId("peltanom15.CTXITEMS");
    ASSERT_TRUE(items);
    EXPECT_EQ(items->progId, "PeltaNom15.ctxItems");
    EXPECT_EQ(fs::canonical(items->path), fs::canonical(PELTA_LIBRARY_FILE));

    // A separate process creates the entry object by programmatic identifier.
    out = run(std::string(PELTA_TOOL_FILE) + " create PeltaNom15.cFormDispatcher", status);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(out, "cFormDispatcher\nPeltaNom15\n");

    out = run(std::string(PELTA_TOOL_FILE) + " unregister " + PELTA_LIBRARY_FILE, status);
    ASSERT_EQ(status, 0) << out;
    entries = reg.entries();
    ASSERT_EQ(entries.size(), 1u);
    EXPECT_EQ(entries[0].clsid, other);
    EXPECT_EQ(entries[0].progId, "PeltaTrade15.ctxInvDocuments");
}

TEST_F(RegistryFile, CreationFailuresNameWhatIsMissing) {
    try {
        pelta::createObject("PeltaNom15.NoSuchObject");
        FAIL() << "created an unregistered object";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::CannotCreateObject);
        EXPECT_NE(e.description().find("PeltaNom15.NoSuchObject"), std::string::npos);
    }
    pelta::ClassRegistry(file_).add(
        {{pelta::Guid::generate(), "Gone.Object", (dir_ / "libGone.so").string()}});
    try {
        pelta::createObject("Gone.Object");
        FAIL() << "created an object of a missing library";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::CannotCreateObject);
        EXPECT_NE(e.description().find("libGone.so"), std::string::npos);
    }
}

TEST_F(RegistryFile, InProcessLibraryAnswersUnloadOnlyWhenNoObjectLives) {
    auto reg = reinterpret_cast<pelta::DllRegisterServerFn>(
        pelta::serverEntryPoint(PELTA_LIBRARY_FILE, "DllRegisterServer"));
    auto canUnload = reinterpret_cast<pelta::DllCanUnloadNowFn>(
        pelta::serverEntryPoint(PELTA_LIBRARY_FILE, "DllCanUnloadNow"));
    ASSERT_EQ(reg(), pelta::kOk);
    EXPECT_EQ(canUnload(), pelta::kOk);
    {
        pelta::ObjectRef d = pelta::createObject("PeltaNom15.cFormDispatcher");
        EXPECT_EQ(canUnload(), pelta::kFalse);
        EXPECT_EQ(pelta::getProperty(d.get(), "LibName").toString(), "PeltaNom15");
    }
    EXPECT_EQ(canUnload(), pelta::kOk);
    // Registered but not yet available classes fail cleanly.
    EXPECT_THROW(pelta::createObject("PeltaNom15.ctxMachines"), pelta::Error);
}

TEST_F(RegistryFile, LocalClassesComeBeforeTheRegistry) {
    struct Local : public virtual pelta::Object {
        std::string typeName() const override { return "Local"; }
    };
    pelta::registerLocalClass("PeltaCm15.Stand", [] { return pelta::ObjectRef(new Local); });
    EXPECT_EQ(pelta::createObject("peltacm15.stand")->typeName(), "Local");
    pelta::unregisterLocalClass("PeltaCm15.Stand");
    EXPECT_THROW(pelta::createObject("PeltaCm15.Stand"), pelta::Error);
}

}  // namespace
