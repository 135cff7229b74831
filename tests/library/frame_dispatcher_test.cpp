// The entry object: the name table, forms created by name, the loaded-forms
// collection, unloading and the termination protocol.
#include <gtest/gtest.h>

#include "library/frame/cFormDispatcher.h"
#include "library/frame/mdGlobals.h"
#include "tests/library/frame_support.h"

using namespace PeltaNom15;
using frametest::JournalForm;
using frametest::ScopedClass;
using frametest::ScratchFolder;

namespace {

auto* const g_env = ::testing::AddGlobalTestEnvironment(new frametest::IsolatedRegistry);

ClassCreator journalCreator(const std::string& name, std::vector<std::string>* journal = nullptr) {
    return [name, journal] { return pelta::ObjectRef(pelta::makeRef<JournalForm>(name, journal)); };
}

class FormDispatcherTest : public ::testing::Test {
protected:
    void TearDown() override {
        for (auto& f : Forms().Items()) {
            if (auto* j = dynamic_cast<JournalForm*>(f.get())) j->refuseUnload = false;
            f->Unload();
        }
        ASSERT_EQ(Forms().Count(), 0);
    }
    // Loads forms named by `names` in order; they journal into `journal`.
    std::vector<pelta::Ref<JournalForm>> load(const std::vector<std::string>& names) {
        std::vector<pelta::Ref<JournalForm>> r;
        for (auto& n : names) {
            auto f = pelta::makeRef<JournalForm>(n, &journal);
            f->Load();
            r.push_back(f);
        }
        return r;
    }
    pelta::Ref<cFormDispatcher> dispatcher = pelta::makeRef<cFormDispatcher>();
    std::vector<std::string> journal;
};

TEST_F(FormDispatcherTest, LibNameIsTheLibrary) {
    EXPECT_EQ(dispatcher->LibName(), "PeltaNom15");
    pelta::Variant none[1];
    EXPECT_EQ(pelta::callByName(dispatcher.get(), "libname", std::span(none, 0)).str(),
              "PeltaNom15");
}

TEST_F(FormDispatcherTest, TableIgnoresCaseAndEveryCallMakesANewInstance) {
    ScratchFolder scratch;
    ScopedClass details("frmItemsDetails", journalCreator("frmItemsDetails"));
    std::string name = "FRMITEMSDETAILS";
    pelta::ObjectRef a = dispatcher->GetForm(name);
    ASSERT_TRUE(a);
    EXPECT_EQ(a->typeName(), "frmItemsDetails");
    std::string again = "frmitemsdetails";
    pelta::ObjectRef b = dispatcher->GetForm(again);
    ASSERT_TRUE(b);
    EXPECT_NE(a.get(), b.get());
    // Taken from the table, not through the loaded-forms collection.
    EXPECT_EQ(scratch.debugText().find("Using Forms.Add"), std::string::npos);
}

TEST_F(FormDispatcherTest, FormOutsideTheTableIsAddedByNameWithADiagnosticLine) {
    ScratchFolder scratch;
    ScopedClass filter("frmItemsFilter", journalCreator("frmItemsFilter"));
    std::string name = "frmItemsFilter";
    pelta::ObjectRef form = dispatcher->GetForm(name);
    ASSERT_TRUE(form);
    EXPECT_EQ(form->typeName(), "frmItemsFilter");
    EXPECT_NE(scratch.debugText().find("Using Forms.Add for PeltaNom15.frmItemsFilter"),
              std::string::npos);
    // It was loaded into the library's collection; no error was logged.
    ASSERT_EQ(Forms().Count(), 1);
    EXPECT_EQ(Forms().Item(0).get(), pelta::query<LibForm>(form.get()));
    EXPECT_TRUE(scratch.logFiles().empty());
}

TEST_F(FormDispatcherTest, LayoutNotInTheTableFailsAndIsLoggedWithItsLocation) {
    ScratchFolder scratch(false);
    std::string name = "arPriceList";
    EXPECT_FALSE(dispatcher->GetForm(name));
    const std::string log = scratch.logText();
    const std::string location = "[" + mdErrorHandling::ComputerName() +
                                 "] PeltaNom15.cFormDispatcher.IZonFormDispatcher_GetForm(sForm="
                                 "arPriceList)";
    EXPECT_NE(log.find("Call stack:\t" + location), std::string::npos) << log;
    EXPECT_EQ(Forms().Count(), 0);
}

TEST_F(FormDispatcherTest, UnknownFormAndUnavailableTableClassReturnNothing) {
    ScratchFolder scratch(false);
    std::string unknown = "frmNoSuchForm";
    EXPECT_FALSE(dispatcher->GetForm(unknown));
    ScopedClass gone("arBomsCost", {});
    std::string layout = "ARBOMSCOST";
    EXPECT_FALSE(dispatcher->GetForm(layout));
    const std::string log = scratch.logText();
    EXPECT_NE(log.find("GetForm(sForm=frmNoSuchForm)"), std::string::npos);
    EXPECT_NE(log.find("GetForm(sForm=ARBOMSCOST)"), std::string::npos);
}

TEST_F(FormDispatcherTest, ErrorHookThatHandlesTheFailureSuppressesTheLog) {
    ScratchFolder scratch(false);
    frametest::HostInstall host;
    host->hookAnswer = kErrorHookRetry;
    std::string name = "arPriceList";
    EXPECT_FALSE(dispatcher->GetForm(name));
    ASSERT_EQ(host->hooked.size(), 1u);
    EXPECT_NE(host->hooked[0].find("IZonFormDispatcher_GetForm(sForm=arPriceList)"),
              std::string::npos);
    EXPECT_TRUE(scratch.logFiles().empty());
}

TEST_F(FormDispatcherTest, UnloadAllFormsUnloadsEveryFormWhileTheCollectionShrinks) {
    EXPECT_EQ(dispatcher->UnloadAllForms(), 0);
    load({"frmA", "frmB", "frmC", "frmD", "frmE"});
    ASSERT_EQ(Forms().Count(), 5);
    EXPECT_EQ(dispatcher->UnloadAllForms(), 0);
    EXPECT_EQ(journal, (std::vector<std::string>{"frmA unloaded", "frmB unloaded", "frmC unloaded",
                                                 "frmD unloaded", "frmE unloaded"}));
}

TEST_F(FormDispatcherTest, UnloadAllFormsCountsTheFormsThatStayed) {
    auto forms = load({"frmA", "frmB", "frmC"});
    forms[1]->refuseUnload = true;
    EXPECT_EQ(dispatcher->UnloadAllForms(), 1);
    EXPECT_EQ(Forms().Item(0).get(), forms[1].get());
}

TEST_F(FormDispatcherTest, QueryTerminateStopsAtTheRefusalAndTellsTheFormsThatAgreed) {
    auto forms = load({"frmA", "frmB", "frmC", "frmD"});
    forms[2]->refuseTerminate = true;  // the second-to-last
    bool cancel = false;
    dispatcher->QueryTerminate(cancel);
    EXPECT_TRUE(cancel);
    EXPECT_EQ(journal, (std::vector<std::string>{"frmD asked", "frmC asked", "frmD abandoned"}));
}

TEST_F(FormDispatcherTest, QueryTerminateAgreedByAllLeavesCancelFalse) {
    load({"frmA", "frmB"});
    bool cancel = false;
    dispatcher->QueryTerminate(cancel);
    EXPECT_FALSE(cancel);
    EXPECT_EQ(journal, (std::vector<std::string>{"frmB asked", "frmA asked"}));
}

TEST_F(FormDispatcherTest, TerminateTellsEveryFormLastToFirst) {
    load({"frmA", "frmB", "frmC"});
    dispatcher->Terminate();
    EXPECT_EQ(journal,
              (std::vector<std::string>{"frmC terminated", "frmB terminated", "frmA terminated"}));
}

TEST_F(FormDispatcherTest, LateBoundGetFormAndQueryTerminate) {
    ScopedClass details("frmItemsDetails", journalCreator("frmItemsDetails"));
    pelta::Variant args[1] = {pelta::Variant("frmItemsDetails")};
    pelta::Variant r = pelta::callByName(dispatcher.get(), "GetForm", args);
    ASSERT_TRUE(r.object());
    EXPECT_EQ(r.object()->typeName(), "frmItemsDetails");
    pelta::Variant cancel[1] = {pelta::Variant(false)};
    pelta::callByName(dispatcher.get(), "QueryTerminate", cancel);
    EXPECT_FALSE(cancel[0].toBool());
}

TEST(FormDispatcherRegister, EntersAndLeavesTheInstanceRegister) {
    const int32_t before = mdErrorHandling::LocalInstanceCount();
    {
        auto d = pelta::makeRef<cFormDispatcher>();
        EXPECT_EQ(mdErrorHandling::LocalInstanceCount(), before + 1);
    }
    EXPECT_EQ(mdErrorHandling::LocalInstanceCount(), before);
}

TEST(FormDispatcherRegister, UsesTheHostDebugConsoleWhenThereIsOne) {
    frametest::HostInstall host;
    host->offerConsole = true;
    {
        auto d = pelta::makeRef<cFormDispatcher>();
        ASSERT_EQ(host->instances.size(), 1u);
        const std::string entry = host->instances.begin()->second;
        EXPECT_EQ(entry.rfind(host->instances.begin()->first + "|", 0), 0u) << entry;
        EXPECT_NE(entry.find("|&H"), std::string::npos);
        EXPECT_TRUE(entry.ends_with("|PeltaNom15.cFormDispatcher")) << entry;
        EXPECT_GE(host->refreshes, 1);
    }
    EXPECT_TRUE(host->instances.empty());
}

}  // namespace
