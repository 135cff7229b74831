// Registration, the shared services, the host application, settings, bags,
// controls, menus, the user agent and the smaller extenders.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <optional>
#include <thread>

#include "framework/extenders.h"
#include "framework/form_extender.h"
#include "framework/grid_extender.h"
#include "framework/services.h"
#include "framework/user_agent.h"
#include "platform/data/recordset.h"
#include "test_screens.h"

namespace {

using namespace fwtest;
using pelta::fw::FormExtender;
using pelta::fw::ScriptedUserAgent;
namespace fs = std::filesystem;

class Services : public ::testing::Test {
protected:
    void SetUp() override {
        pelta::fw::registerFramework();
        pelta::fw::services()->reset();
    }
    void TearDown() override {
        pelta::fw::services()->reset();
        std::error_code ec;
        fs::remove_all(dir, ec);
    }

    pelta::Ref<FormExtender> makeForm(const std::string& name, const std::string& layoutKey = {}) {
        auto f = pelta::queryRef<FormExtender>(pelta::createObject(kProgIdFormExtender));
        f->Init(nullptr, "Тест", "PeltaNom15", name, 0);
        if (!layoutKey.empty()) f->SetLayoutKey(layoutKey);
        return f;
    }

    fs::path dir =
        fs::temp_directory_path() /
        ("pelta_fw_" + std::to_string(::testing::UnitTest::GetInstance()->random_seed()) + "_" +
         ::testing::UnitTest::GetInstance()->current_test_info()->name());
};

TEST_F(Services, EveryIdentifierCreatesItsKindAndTheServicesAreShared) {
    auto a = pelta::createObject(kProgIdFrameworkServices);
    auto b = pelta::createObject(kProgIdFrameworkServices);
    EXPECT_EQ(a, b);
    EXPECT_TRUE(pelta::implements<IFrameworkServices>(a.get()));
    EXPECT_EQ(a.get(), static_cast<pelta::Object*>(pelta::fw::services().get()));

    EXPECT_TRUE(pelta::implements<IFormExtender>(pelta::createObject(kProgIdFormExtender).get()));
    EXPECT_TRUE(pelta::implements<IGridExtender>(pelta::createObject(kProgIdGridExtender).get()));
    EXPECT_TRUE(pelta::implements<IDetailOpener>(pelta::createObject(kProgIdDetailOpener).get()));
    EXPECT_TRUE(pelta::implements<ITreeExtender>(pelta::createObject(kProgIdTreeExtender).get()));
    EXPECT_TRUE(
        pelta::implements<ISplitterExtender>(pelta::createObject(kProgIdSplitterExtender).get()));
    EXPECT_TRUE(pelta::implements<ITabExtender>(pelta::createObject(kProgIdTabExtender).get()));
    EXPECT_TRUE(pelta::implements<IQuickFilterExtender>(
        pelta::createObject(kProgIdQuickFilterExtender).get()));
    EXPECT_TRUE(
        pelta::implements<IFooterExtender>(pelta::createObject(kProgIdFooterExtender).get()));
    EXPECT_TRUE(
        pelta::implements<IPresetExtender>(pelta::createObject(kProgIdPresetExtender).get()));
    EXPECT_TRUE(
        pelta::implements<IReportExtender>(pelta::createObject(kProgIdReportExtender).get()));
    EXPECT_TRUE(pelta::implements<IFieldExtender>(pelta::createObject(kProgIdFieldExtender).get()));
    EXPECT_NE(pelta::createObject(kProgIdFormExtender), pelta::createObject(kProgIdFormExtender));
}

TEST_F(Services, CreateObjectAnswersNullWhenRefused) {
    auto services = pelta::fw::services();
    EXPECT_FALSE(services->CreateObject("PeltaTrade15.NoSuchThing"));
    EXPECT_TRUE(services->CreateObject(kProgIdTabExtender));
    services->refuseObject("peltacm15.tabextender");
    EXPECT_FALSE(services->CreateObject(kProgIdTabExtender));
    services->allowObject(kProgIdTabExtender);
    EXPECT_TRUE(services->CreateObject(kProgIdTabExtender));
    EXPECT_FALSE(services->HostApplication()->CreateForm("PeltaNom15.frmNoSuchForm"));

    services->SetMousePointer(11);
    EXPECT_EQ(pelta::queryRef<IFrameworkServices>(pelta::createObject(kProgIdFrameworkServices))
                  ->MousePointer(),
              11);
}

TEST_F(Services, HostApplicationHookLoggerAndConsole) {
    auto host = pelta::fw::services()->host();
    host->setLogName("demo");
    EXPECT_EQ(pelta::fw::services()->HostApplication()->LogName(), "demo");

    EXPECT_EQ(host->ErrorHook(13, "ctxRatios.pvInit", "Type mismatch", "line 3"), 0);
    host->setErrorAction(kErrorHookRetry);
    EXPECT_EQ(host->ErrorHook(5, "src", "desc", "loc"), kErrorHookRetry);
    auto offered = host->offeredErrors();
    ASSERT_EQ(offered.size(), 2u);
    EXPECT_EQ(offered[0].number, 13);
    EXPECT_EQ(offered[0].source, "ctxRatios.pvInit");
    EXPECT_EQ(offered[1].location, "loc");

    fs::create_directories(dir);
    auto logger = host->Logger();
    ASSERT_TRUE(logger);
    auto file = (dir / "errors.log").string();
    ASSERT_TRUE(logger->Open(file));
    logger->Print("first");
    logger->Print("второ");
    EXPECT_EQ(logger->Length(), static_cast<int64_t>(std::string("first\nвторо\n").size()));
    logger->Close();
    ASSERT_TRUE(logger->Open(file));  // appends
    logger->Print("third");
    logger->Close();
    std::ifstream in(file);
    std::string all((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    EXPECT_EQ(all, "first\nвторо\nthird\n");
    EXPECT_FALSE(logger->Open((dir / "missing" / "x.log").string()));

    auto console = host->DebugConsole();
    int32_t first = console->NextInstanceID();
    EXPECT_EQ(console->NextInstanceID(), first + 1);
    EXPECT_TRUE(console->AddInstance("ctxRatios#1", "ctxRatios"));
    EXPECT_FALSE(console->AddInstance("ctxRatios#1", "again"));
    EXPECT_EQ(console->InstanceCount(), 1);
    EXPECT_TRUE(console->RemoveInstance("ctxRatios#1"));
    EXPECT_FALSE(console->RemoveInstance("ctxRatios#1"));
    EXPECT_EQ(console->InstanceCount(), 0);

    host->setOption("SearchByCodeFirst", pelta::Variant(true));
    EXPECT_TRUE(host->Option("searchbycodefirst").toBool());
    EXPECT_TRUE(host->Option("MatchMode").isEmpty());
}

TEST_F(Services, ClientSiteParameters) {
    auto site = pelta::makeRef<pelta::fw::ClientSite>(nullptr, true);
    site->setParameter("MultiSelect", pelta::Variant(true)).setParameter("QuickFindText", "/12");
    EXPECT_TRUE(site->IsSelector());
    EXPECT_TRUE(site->Parameter("multiselect").toBool());
    EXPECT_EQ(site->Parameter("QuickFindText").toString(), "/12");
    EXPECT_TRUE(site->Parameter("CurrentValue").isEmpty());
}

TEST_F(Services, SettingsAreKeptPerLayoutKeyAndInTheFile) {
    auto a = makeForm("ctxRatios", "{E604AA9E-3601-4FDE-93D8-86CFC5920C47}");
    auto b = makeForm("frmRatiosDetails", "{687449F9-346A-40D3-B676-908472759566}");
    auto c = makeForm("frmOther");  // no key: its object name
    a->SaveSetting("SplitterAdditional", pelta::Variant(0.25));
    b->SaveSetting("SplitterAdditional", pelta::Variant(0.75));
    c->SaveSetting("LastFolder", pelta::Variant("/tmp"));
    EXPECT_DOUBLE_EQ(a->GetSetting("splitteradditional", {}).toDouble(), 0.25);
    EXPECT_DOUBLE_EQ(b->GetSetting("SplitterAdditional", {}).toDouble(), 0.75);
    EXPECT_EQ(a->GetSetting("LastFolder", pelta::Variant("none")).toString(), "none");
    EXPECT_EQ(makeForm("frmOther")->GetSetting("LastFolder", {}).toString(), "/tmp");

    // Kept in a file: a new session finds them; a damaged file is ignored.
    fs::create_directories(dir);
    auto file = dir / "settings.bin";
    auto& store = pelta::fw::services()->settings();
    store.setFile(file);
    a->SaveSetting("CurrentTab", pelta::Variant(2));
    ASSERT_TRUE(fs::exists(file));

    pelta::fw::SettingsStore next;
    next.setFile(file);
    EXPECT_EQ(next.get("{E604AA9E-3601-4FDE-93D8-86CFC5920C47}", "CurrentTab", {}).toLong(), 2);
    EXPECT_DOUBLE_EQ(
        next.get("{687449F9-346A-40D3-B676-908472759566}", "SplitterAdditional", {}).toDouble(),
        0.75);

    {
        std::ofstream out(file, std::ios::binary | std::ios::trunc);
        out << "not a bag at all";
    }
    pelta::fw::SettingsStore damaged;
    damaged.setFile(file);
    EXPECT_TRUE(damaged.get("frmOther", "LastFolder", {}).isEmpty());
    damaged.put("frmOther", "LastFolder", pelta::Variant("/srv"));
    pelta::fw::SettingsStore repaired;
    repaired.setFile(file);
    EXPECT_EQ(repaired.get("frmOther", "LastFolder", {}).toString(), "/srv");
}

// A screen owning a form and a splitter, as detail forms own theirs.
class SplitScreen : public virtual pelta::Object {
public:
    pelta::Ref<IFormExtender> form = create<IFormExtender>(kProgIdFormExtender);
    pelta::Ref<ISplitterExtender> splitter = create<ISplitterExtender>(kProgIdSplitterExtender);
    explicit SplitScreen(const std::string& key) {
        form->Init(this, "Тест", "PeltaNom15", "frmSplit", 0);
        form->SetLayoutKey(key);
        splitter->Init(this, "SplitterAttrib", 0.5);
    }
};

TEST_F(Services, SplitterPositionIsKeptUnderTheOwnersLayoutKey) {
    auto first = pelta::makeRef<SplitScreen>("{A}");
    EXPECT_DOUBLE_EQ(first->splitter->Position(), 0.5);
    bool refuse = true;
    double splitAt = 0;
    first->splitter->Events().BeginSplit = [&](bool& cancel) { cancel = refuse; };
    first->splitter->Events().Split = [&](double p) { splitAt = p; };
    auto* s = pelta::query<pelta::fw::SplitterExtender>(first->splitter.get());
    EXPECT_FALSE(s->drag(0.3));
    EXPECT_DOUBLE_EQ(first->splitter->Position(), 0.5);
    refuse = false;
    EXPECT_TRUE(s->drag(0.3));
    EXPECT_DOUBLE_EQ(splitAt, 0.3);

    EXPECT_DOUBLE_EQ(pelta::makeRef<SplitScreen>("{A}")->splitter->Position(), 0.3);
    EXPECT_DOUBLE_EQ(pelta::makeRef<SplitScreen>("{B}")->splitter->Position(), 0.5);
}

TEST_F(Services, BagsCrossAsBytes) {
    auto form = makeForm("frmBag");
    auto request = form->CreatePropertyBag();
    request->writeProperty("ID", pelta::Variant(kRateBnb1));
    request->writeProperty("List", pelta::Variant(pelta::ObjectRef(ratesList())));
    auto bytes = request->contents();

    auto context = pelta::makeRef<TransportContext>();
    auto opened = form->CreatePropertyBag(bytes, kBagConst1, kBagConst2, context);
    EXPECT_EQ(opened->readProperty("ID").toString(), kRateBnb1);
    auto list = recordsetOf(opened->readProperty("List"));
    ASSERT_TRUE(list);
    EXPECT_EQ(list->recordCount(), 3);
    EXPECT_TRUE(opened->readProperty("Missing").isEmpty());
    EXPECT_EQ(form->CreatePropertyBag({}, kBagConst1, kBagConst2, nullptr)->count(), 0u);

    EXPECT_THROW(form->CreatePropertyBag(bytes, 1, -2, context), pelta::Error);
    try {
        form->CreatePropertyBag(pelta::Bytes{1, 2, 3, 4, 5}, kBagConst1, kBagConst2, context);
        FAIL() << "garbage opened as a bag";
    } catch (const pelta::Error& e) {
        EXPECT_EQ(e.number(), pelta::errc::InvalidData);
    }
}

TEST_F(Services, MenuModel) {
    auto form = makeForm("ctxMenu");
    form->AddCommand(9001, "Печат на етикети\tCtrl+L", "tools");
    ASSERT_NE(form->command(9001), nullptr);
    EXPECT_EQ(form->command(9001)->shortcut, "Ctrl+L");
    form->EnableCommand(kCmdRefresh, false);
    form->ShowCommand(kCmdNew, false);
    EXPECT_THROW(form->SetCommandTooltip(4711, "x"), pelta::Error);

    std::vector<int32_t> executed;
    form->Events().BeforeExecute = [&](int32_t id, bool& handled) {
        executed.push_back(id);
        handled = true;
    };
    std::vector<int32_t> after;
    form->Events().AfterExecute = [&](int32_t id) { after.push_back(id); };
    EXPECT_FALSE(form->executeShortcut("F5"));      // disabled
    EXPECT_FALSE(form->executeShortcut("Ctrl+N"));  // hidden
    EXPECT_TRUE(form->executeShortcut("ctrl+l"));
    EXPECT_EQ(executed, std::vector<int32_t>{9001});
    EXPECT_EQ(after, std::vector<int32_t>{9001});

    // Unhandled 207 is the framework's refresh.
    form->Events().BeforeExecute = nullptr;
    int fetched = 0;
    form->Events().Fetch = [&](int32_t step, bool&) { fetched += step; };
    form->Execute(kCmdRefresh);
    EXPECT_EQ(fetched, 1);
    EXPECT_EQ(after.back(), kCmdRefresh);
}

TEST_F(Services, DeclaredControlsHoldValues) {
    auto form = makeForm("frmControls");
    form->DeclareControls({control("txtName", ControlKind::Text, "Име", "Name"),
                           control("chkIsActive", ControlKind::CheckBox, "Активен", "IsActive"),
                           control("cboBank", ControlKind::Combo, "Банка", "Pr_ID")});
    EXPECT_THROW(form->DeclareControls({control("TXTNAME", ControlKind::Text)}), pelta::Error);
    EXPECT_THROW(
        form->DeclareControls({control("a", ControlKind::Text), control("A", ControlKind::Text)}),
        pelta::Error);
    EXPECT_EQ(form->controls().size(), 3u);
    EXPECT_FALSE(form->ControlValue("chkIsActive").toBool());
    EXPECT_TRUE(form->ControlValue("txtName").isEmpty());
    form->SetControlValue("TxtName", pelta::Variant("Иван"));
    EXPECT_EQ(form->ControlValue("txtName").toString(), "Иван");
    EXPECT_THROW(form->ControlValue("txtNmae"), pelta::Error);
    EXPECT_THROW(form->SetFocus("nothing"), pelta::Error);

    auto banks = ratesList();
    EXPECT_THROW(form->SetControlList("cboBank", banks, "ID", {"Bank"}), pelta::Error);
    form->SetControlList("cboBank", banks, "ID", {"PrName"});
    ASSERT_NE(form->controlList("cbobank"), nullptr);
    EXPECT_EQ(form->controlList("cboBank")->shownFields, std::vector<std::string>{"PrName"});

    // A field extender sees the control's value and hears the user's changes.
    auto field = create<IFieldExtender>(kProgIdFieldExtender);
    EXPECT_THROW(field->Init(form.get(), "cboNothing"), pelta::Error);
    field->Init(form.get(), "cboBank");
    int changes = 0;
    field->Events().Change = [&] { ++changes; };
    field->SetValue(pelta::Variant(kBankBnb));  // by the screen: no event
    EXPECT_EQ(form->ControlValue("cboBank").toString(), kBankBnb);
    form->userSetValue("cboBank", pelta::Variant("{X}"));
    EXPECT_EQ(changes, 1);
    EXPECT_EQ(field->Value().toString(), "{X}");
    field.reset();  // a dropped field extender hears nothing more
    form->userSetValue("cboBank", pelta::Variant("{Y}"));
    EXPECT_EQ(changes, 1);

    bool refuse = true;
    form->Events().BeforeControlSetFocus = [&](const std::string&, bool& cancel) {
        cancel = refuse;
    };
    EXPECT_FALSE(form->userFocus("txtName"));
    refuse = false;
    EXPECT_TRUE(form->userFocus("TXTNAME"));
    EXPECT_EQ(form->focus(), "txtName");
}

TEST_F(Services, PromptsReachTheThreadsAgent) {
    auto form = makeForm("frmAsk");
    // No agent at all: the prompt cannot be answered.
    EXPECT_THROW(form->MsgBox("Здравей", vbOKOnly), pelta::Error);

    auto shared = pelta::makeRef<ScriptedUserAgent>();
    pelta::fw::services()->setUserAgent(shared);
    EXPECT_EQ(form->MsgBox("Здравей", vbInformation, {}, "подробности"), vbOK);
    EXPECT_EQ(shared->last().caption, "Тест");
    EXPECT_EQ(shared->last().details, "подробности");

    auto own = pelta::makeRef<ScriptedUserAgent>();
    {
        pelta::fw::UserAgentScope scope(own);
        own->answer(vbYes).answerInput(pelta::Variant("12"), "Брой").cancelInput();
        EXPECT_EQ(form->AskYesNo("Продължаване?", "Въпрос"), vbYes);
        pelta::Variant value = pelta::Variant("1");
        EXPECT_TRUE(form->InputBox("Брой етикети", "Печат", value));
        EXPECT_EQ(value.toString(), "12");
        EXPECT_FALSE(form->InputBox("Брой етикети", "Печат", value));
        EXPECT_EQ(value.toString(), "12");
        form->ShowMessage({}, "Готово", "Заглавие", "съвет");

        // Another thread still goes to the shared agent.
        std::thread([&] { form->MsgBox("от друга нишка", vbOKOnly); }).join();
    }
    auto prompts = own->prompts();
    ASSERT_EQ(prompts.size(), 4u);
    EXPECT_EQ(prompts[0].style, vbYesNo | vbQuestion);
    EXPECT_EQ(prompts[0].caption, "Въпрос");
    EXPECT_EQ(prompts[1].kind, pelta::fw::PromptKind::InputBox);
    EXPECT_EQ(prompts[1].title, "Печат");
    EXPECT_EQ(prompts[1].value.toString(), "1");
    EXPECT_EQ(prompts[3].title, "Заглавие");
    EXPECT_EQ(prompts[3].hint, "съвет");
    EXPECT_EQ(shared->texts().back(), "от друга нишка");

    // An input answer is not a button.
    own->answerInput(pelta::Variant("x"));
    pelta::fw::UserAgentScope scope(own);
    EXPECT_THROW(form->AskYesNo("Продължаване?"), pelta::fw::UnscriptedPrompt);
}

TEST_F(Services, SmallerExtendersRaiseTheirEvents) {
    auto tab = create<ITabExtender>(kProgIdTabExtender);
    tab->Init(nullptr, {"Основни", "Допълнителни", "Атрибути"});
    auto* t = pelta::query<pelta::fw::TabExtender>(tab.get());
    std::vector<int32_t> clicked;
    tab->Events().BeforeClick = [](int32_t tab, bool& cancel) { cancel = tab == 2; };
    tab->Events().Click = [&](int32_t tab) { clicked.push_back(tab); };
    EXPECT_TRUE(t->click(1));
    EXPECT_FALSE(t->click(2));
    EXPECT_EQ(tab->CurrentTab(), 1);
    EXPECT_EQ(clicked, std::vector<int32_t>{1});
    EXPECT_THROW(tab->SetCurrentTab(3), pelta::Error);

    auto tree = create<ITreeExtender>(kProgIdTreeExtender);
    tree->Init(nullptr, "tvGroups", 0);
    tree->AddNode({}, "root", "Всички");
    tree->AddNode("root", "a", "А");
    EXPECT_THROW(tree->AddNode("nowhere", "b", "Б"), pelta::Error);
    EXPECT_THROW(tree->AddNode({}, "a", "А"), pelta::Error);
    std::string activated;
    tree->Events().NodeActivate = [&](const std::string& key) { activated = key; };
    EXPECT_TRUE(tree->SelectNode("a"));
    EXPECT_FALSE(tree->SelectNode("b"));
    EXPECT_EQ(activated, "a");
    EXPECT_EQ(tree->SelectedKey(), "a");

    auto footer = create<IFooterExtender>(kProgIdFooterExtender);
    footer->Init(nullptr, {"Избор", "Отказ"});
    int32_t pressed = -1;
    footer->Events().Click = [&](int32_t b) { pressed = b; };
    pelta::query<pelta::fw::FooterExtender>(footer.get())->click(1);
    EXPECT_EQ(pressed, 1);

    auto preset = create<IPresetExtender>(kProgIdPresetExtender);
    preset->Init(nullptr, "{P}");
    preset->Events().UpdateDescription = [](std::string& d) { d = "Активни"; };
    EXPECT_EQ(pelta::query<pelta::fw::PresetExtender>(preset.get())->updateDescription(),
              "Активни");

    auto report = create<IReportExtender>(kProgIdReportExtender);
    report->Init(nullptr, "Ценова листа", "PeltaNom15", "cRepPriceList");
    std::vector<std::string> order;
    report->Events().Filter = [&](bool&) { order.push_back("Filter"); };
    report->Events().Fetch = [&](int32_t, bool&) { order.push_back("Fetch"); };
    report->Events().ReportStart = [&] { order.push_back("ReportStart"); };
    report->Events().FillControls = [&] { order.push_back("FillControls"); };
    EXPECT_TRUE(pelta::query<pelta::fw::ReportExtender>(report.get())->run());
    EXPECT_EQ(order, (std::vector<std::string>{"Filter", "Fetch", "ReportStart", "FillControls"}));
    report->Events().Fetch = [](int32_t, bool& cancel) { cancel = true; };
    EXPECT_FALSE(pelta::query<pelta::fw::ReportExtender>(report.get())->run());
}

}  // namespace

namespace {

// Tells which documents were shown, as the web shell's agent does.
class ShowingAgent final : public pelta::fw::UserAgent {
public:
    int32_t messageBox(const pelta::fw::Prompt&) override { return vbOK; }
    void anchoredMessage(const pelta::fw::Prompt&) override {}
    std::optional<pelta::Variant> inputBox(const pelta::fw::Prompt&) override {
        return std::nullopt;
    }
    void documentShown(FormExtender& form) override { shown.push_back(&form); }
    std::vector<FormExtender*> shown;
};

TEST_F(Services, AShownDocumentIsToldToTheAgentUnlessItsFetchIsCancelled) {
    auto form = makeForm("frmDetails");
    auto agent = pelta::makeRef<ShowingAgent>();
    pelta::fw::UserAgentScope scope(agent);
    bool cancel = false;
    form->Events().Fetch = [&](int32_t, bool& Cancel) { Cancel = cancel; };
    EXPECT_TRUE(form->ShowDocument("{1}"));
    ASSERT_EQ(agent->shown.size(), 1u);
    EXPECT_EQ(agent->shown[0], form.get());
    cancel = true;
    EXPECT_FALSE(form->ShowDocument("{2}"));
    EXPECT_EQ(agent->shown.size(), 1u);
}

TEST_F(Services, GridsAreFoundByOwnerOnTheThreadThatMadeThem) {
    auto owner = pelta::makeRef<pelta::fw::ClientSite>(nullptr);
    auto other = pelta::makeRef<pelta::fw::ClientSite>(nullptr);
    auto make = [](pelta::Object* o, const std::string& name) {
        auto g = pelta::queryRef<pelta::fw::GridExtender>(pelta::createObject(kProgIdGridExtender));
        g->Init(o, name, 0, {});
        return g;
    };
    auto first = make(owner.get(), "geRows");
    auto second = make(owner.get(), "geAttribs");
    auto foreign = make(other.get(), "geCtl");
    auto grids = pelta::fw::services()->gridsOfOwner(owner.get());
    ASSERT_EQ(grids.size(), 2u);
    EXPECT_EQ(grids[0], first.get());
    EXPECT_EQ(grids[1], second.get());
    // Another thread's host sees none of them.
    size_t seen = 99;
    std::thread([&] { seen = pelta::fw::services()->gridsOfOwner(owner.get()).size(); }).join();
    EXPECT_EQ(seen, 0u);
    second.reset();
    EXPECT_EQ(pelta::fw::services()->gridsOfOwner(owner.get()).size(), 1u) << "gone when released";
}

TEST_F(Services, AComboColumnKeepsTheRowsItOffers) {
    auto g = pelta::queryRef<pelta::fw::GridExtender>(pelta::createObject(kProgIdGridExtender));
    g->Init(nullptr, "geRows", 0, {});
    PeltaNom15::ColumnDecl c;
    c.Key = c.Field = "Currency_ID";
    c.Editor = PeltaNom15::EditorKind::Combo;
    g->DeclareColumns({c});
    auto rows = pelta::makeRef<pelta::Recordset>();
    rows->appendField("ID", pelta::FieldType::Text);
    rows->appendField("Code", pelta::FieldType::Text);
    rows->open();
    EXPECT_THROW(g->SetColumnList("Nope", rows, "ID", {"Code"}), pelta::Error);
    EXPECT_THROW(g->SetColumnList("currency_id", rows, "ID", {"Name"}), pelta::Error);
    g->SetColumnList("currency_id", rows, "ID", {"Code"});
    ASSERT_NE(g->columnList("Currency_ID"), nullptr);
    EXPECT_EQ(g->columnList("Currency_ID")->shownFields, std::vector<std::string>{"Code"});
    g->SetColumnList("Currency_ID", nullptr, {}, {});
    EXPECT_EQ(g->columnList("Currency_ID"), nullptr);
}

}  // namespace
