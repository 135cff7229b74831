// A detail form with an attribute grid and a tree of lists, written as the
// library writes its screens and hosted by the framework adapter, driven
// through the JSON interface as the page drives it.
#include <gtest/gtest.h>
#include <stdlib.h>

#include <filesystem>

#include "bll/service.h"
#include "framework/attrib_grid.h"
#include "framework/services.h"
#include "library/contracts/Constants.h"
#include "library/contracts/Extenders.h"
#include "library/contracts/IZonTerminate.h"
#include "library/contracts/Public.h"
#include "platform/automation/error.h"
#include "platform/automation/registry.h"
#include "platform/data/recordset.h"
#include "shell/api.h"
#include "shell/framework_screens.h"
#include "shell/session.h"
#include "shell_test_util.h"

namespace pelta::shell {
namespace {

namespace fs = std::filesystem;
using json = nlohmann::json;
using namespace PeltaNom15;
using testing::nextEvent;

constexpr const char* kThing = "{66666666-0000-0000-0000-000000000001}";
constexpr const char* kUsd = "{33333333-0000-0000-0000-00000000000A}";
constexpr const char* kEur = "{33333333-0000-0000-0000-00000000000B}";
constexpr const char* kSet = "{44444444-0000-0000-0000-000000000001}";
constexpr const char* kRoot = "{55555555-0000-0000-0000-000000000001}";
constexpr const char* kLeaf = "{55555555-0000-0000-0000-000000000002}";

template <class I>
pelta::Ref<I> make(const char* progId) {
    auto o = pelta::queryRef<I>(pelta::createObject(progId));
    if (!o) throw std::logic_error(std::string("The framework offers no ") + progId);
    return o;
}

RecordsetRef rows(std::vector<std::pair<std::string, pelta::FieldType>> fields,
                  std::vector<std::vector<Variant>> values) {
    auto rs = pelta::makeRef<pelta::Recordset>();
    for (auto& [name, type] : fields) {
        if (type == pelta::FieldType::Decimal)
            rs->appendDecimalField(name, 18, 8);
        else
            rs->appendField(name, type, 0);
    }
    rs->open();
    for (auto& row : values) {
        rs->addNew();
        for (size_t i = 0; i < row.size(); ++i)
            rs->setValue(i, row[i]);
        rs->update();
    }
    rs->updateBatch();
    return rs;
}

ControlDecl control(std::string name, ControlKind kind, std::string caption, std::string field,
                    std::string group) {
    ControlDecl c;
    c.Name = std::move(name);
    c.Kind = kind;
    c.Caption = std::move(caption);
    c.Field = std::move(field);
    c.Group = std::move(group);
    return c;
}

AttribDecl attrib(int32_t group, std::string caption, std::string field, AttribEditor editor,
                  std::string help = {}) {
    AttribDecl a;
    a.Group = group;
    a.Caption = std::move(caption);
    a.Field = std::move(field);
    a.Editor = editor;
    a.Help = std::move(help);
    return a;
}

// The editor of a thing: its name, an attribute grid and a tree whose
// "Баркодове" node shows the barcodes grid and code field.
class ThingDetails : public virtual pelta::Object {
public:
    pelta::Ref<IFormExtender> m_oForm;
    pelta::Ref<IAttribGridExtender> m_oAttribExt;
    pelta::Ref<ITreeExtender> m_oTreeExt;
    pelta::Ref<IGridExtender> m_oBarcodesExt;
    RecordsetRef head, barcodes;
    std::string key;

    void frInit(IClientSite* site) {
        m_oForm = make<IFormExtender>(kProgIdFormExtender);
        m_oForm->Init(this, "Продукт/материал", "PeltaTest", "frmThingDetails", 0);
        m_oForm->SetClientSite(site);
        m_oForm->DeclareControls({
            control("txtName", ControlKind::Text, "Име:", "Name", "Общи"),
            control("txtBarcodeNote", ControlKind::Text, "Бележка:", "", "nBarcodes"),
            control("geBarcodes", ControlKind::Grid, "Баркодове", "", "nBarcodes"),
        });
        m_oAttribExt = make<IAttribGridExtender>(kProgIdAttribGridExtender);
        m_oAttribExt->Init(this, "agAttribs", "1|Основни|2|Мерки|99|Други");
        m_oAttribExt->AddAttribute(
            attrib(1, "Допълнително име", "Name2", AttribEditor::Entry, "Име на чужд език."));
        m_oAttribExt->AddAttribute(
            attrib(1, "Валута по подразбиране", "Currency_ID", AttribEditor::List));
        AttribDecl priceMake = attrib(1, "Ценообразуване", "PriceMake", AttribEditor::FixedList,
                                      "Използва се при [b]Печат на ценови оферти[/b].");
        priceMake.Values = "0|(Няма)|1|На база обем|2|На база тегло";
        m_oAttribExt->AddAttribute(priceMake);
        AttribDecl neto = attrib(2, "Нето тегло", "WeightNeto", AttribEditor::Entry);
        neto.Format = "#,##0.000#####";
        m_oAttribExt->AddAttribute(neto);
        AttribDecl bruto = attrib(2, "Бруто тегло", "WeightBruto", AttribEditor::Entry);
        bruto.Format = "#,##0.000#####";
        m_oAttribExt->AddAttribute(bruto);
        m_oAttribExt->AddAttribute(attrib(99, "Амбалаж", "IsPacking", AttribEditor::CheckBox));
        AttribDecl sec = attrib(99, "Продукт", "SecItm_ID", AttribEditor::Selector);
        sec.ShownField = "SecItmName";
        m_oAttribExt->AddAttribute(sec);
        m_oAttribExt->AddAttribute(
            attrib(99, "Направление", "FinStruct_ID", AttribEditor::TreeList));

        auto& a = m_oAttribExt->Events();
        a.BeforeUpdate = [this](const std::string& field, Variant& value, bool& cancel) {
            if (field == "Name2" && !value.isNull() && value.toString() == "забранено")
                cancel = true;
        };
        // The gross weight follows the net weight.
        a.AfterUpdate = [this](const std::string& field) {
            if (field != "WeightNeto") return;
            Variant neto = m_oAttribExt->Value("WeightNeto");
            m_oAttribExt->SetValue("WeightBruto",
                                   neto.isNull() ? Variant::null() : Variant(neto.toDecimal() * 2));
        };
        a.ButtonClick = [this](const std::string& field) {
            m_oAttribExt->UserSetValue(field, Variant(kSet));
            m_oAttribExt->SetShownText(field, "Комплект");
        };
        a.RowFormat = [this](const std::string& field, std::string&, std::string& style) {
            if (field == "Name2" && m_oAttribExt->Value("Name2").isNull()) style = "Required";
        };

        m_oTreeExt = make<ITreeExtender>(kProgIdTreeExtender);
        m_oTreeExt->Init(this, "tvLists", 0);
        m_oTreeExt->Events().NodeActivate = [this](const std::string& node) {
            if (node == "nBarcodes" && !m_oBarcodesExt->Rows()) m_oBarcodesExt->Bind(barcodes);
        };
        m_oBarcodesExt = make<IGridExtender>(kProgIdGridExtender);
        m_oBarcodesExt->Init(this, "geBarcodes", 0, {});
        ColumnDecl code;
        code.Key = code.Field = "BarCode";
        code.Caption = "Баркод";
        code.Editor = EditorKind::Text;
        m_oBarcodesExt->DeclareColumns({code});

        m_oForm->Events().Fetch = [this](int32_t, bool&) {
            head = rows({{"ID", pelta::FieldType::Guid},
                         {"Name", pelta::FieldType::Text},
                         {"Name2", pelta::FieldType::Text},
                         {"Currency_ID", pelta::FieldType::Guid},
                         {"PriceMake", pelta::FieldType::Long},
                         {"WeightNeto", pelta::FieldType::Decimal},
                         {"WeightBruto", pelta::FieldType::Decimal},
                         {"IsPacking", pelta::FieldType::Boolean},
                         {"SecItm_ID", pelta::FieldType::Guid},
                         {"SecItmName", pelta::FieldType::Text},
                         {"FinStruct_ID", pelta::FieldType::Guid}},
                        {{Variant(key), Variant("Винт"), Variant::null(), Variant(kUsd), Variant(0),
                          Variant(pelta::Decimal(1)), Variant(pelta::Decimal(2)), Variant(false),
                          Variant::null(), Variant::null(), Variant::null()}});
            barcodes = rows({{"BarCode", pelta::FieldType::Text}}, {{Variant("3800000000015")}});
        };
        m_oForm->Events().FillControls = [this] {
            m_oForm->SetControlValue("txtName", head->value("Name"));
            m_oAttribExt->SetList(
                "Currency_ID",
                rows({{"ID", pelta::FieldType::Guid}, {"Code", pelta::FieldType::Text}},
                     {{Variant(kUsd), Variant("USD")}, {Variant(kEur), Variant("EUR")}}),
                "ID", "Code");
            m_oAttribExt->SetList("FinStruct_ID",
                                  rows({{"ID", pelta::FieldType::Guid},
                                        {"P_ID", pelta::FieldType::Guid},
                                        {"Name", pelta::FieldType::Text}},
                                       {{Variant(kRoot), Variant::null(), Variant("Продажби")},
                                        {Variant(kLeaf), Variant(kRoot), Variant("Едро")}}),
                                  "ID", "Name", "P_ID");
            m_oAttribExt->Bind(head);
            m_oTreeExt->Clear();
            m_oTreeExt->AddNode("", "nLists", "Списъци");
            m_oTreeExt->AddNode("nLists", "nBarcodes", "Баркодове");
            m_oTreeExt->AddNode("nLists", "nPrices", "Ценови листи");
        };
    }

    void show(const std::string& id) {
        key = id;
        m_oForm->ShowDocument(id);
    }
};

class ThingsList : public IZonListControl, public IZonTerminate {
public:
    pelta::Ref<IFormExtender> m_oForm;
    pelta::Ref<IGridExtender> m_oGridExt;
    pelta::Ref<IClientSite> site;
    pelta::Ref<ThingDetails> details;

    bool InitClientSite(IClientSite* Site) override {
        site = Site;
        m_oForm = make<IFormExtender>(kProgIdFormExtender);
        m_oForm->Init(this, "Неща", "PeltaTest", "ctxThings", 0);
        m_oForm->SetClientSite(Site);
        m_oGridExt = make<IGridExtender>(kProgIdGridExtender);
        m_oGridExt->Init(this, "geCtl", 0, {});
        ColumnDecl id;
        id.Key = id.Field = "ID";
        m_oGridExt->DeclareColumns({id});
        m_oForm->Events().FillControls = [this] {
            m_oGridExt->Bind(rows({{"ID", pelta::FieldType::Guid}}, {{Variant(kThing)}}));
        };
        m_oForm->Events().BeforeExecute = [this](int32_t command, bool& handled) {
            if (command != kCmdOpen) return;
            handled = true;
            if (!details) {
                details = pelta::makeRef<ThingDetails>();
                details->frInit(site.get());
            }
            details->show(m_oGridExt->CurrentValue("ID").toString());
        };
        return true;
    }
    void QueryTerminate(bool&) override {}
    void Terminate() override {
        details.reset();
        m_oGridExt.reset();
        m_oForm.reset();
        site.reset();
    }
};

class ThingsSession : public LibrarySession {
public:
    explicit ThingsSession(std::unique_ptr<ListAdapter> adapter) : adapter_(std::move(adapter)) {}
    std::shared_ptr<Screen> openList(const std::string& id) override {
        if (id != "test.ctxThings")
            pelta::raise(pelta::errc::ClassNotAvailable, "No list " + id, "test");
        return adapter_->openList(pelta::ObjectRef(pelta::makeRef<ThingsList>()));
    }
    void terminate() override { adapter_.reset(); }

private:
    std::unique_ptr<ListAdapter> adapter_;
};

class ThingsProvider : public ScreenProvider {
public:
    explicit ThingsProvider(ListAdapterFactory factory) : factory_(std::move(factory)) {}
    std::vector<NavigationEntry> navigation() override {
        return {NavigationEntry{"test.ctxThings", "Неща", true}};
    }
    std::unique_ptr<LibrarySession> startSession(ScreenHost& host) override {
        return std::make_unique<ThingsSession>(factory_(host));
    }

private:
    ListAdapterFactory factory_;
};

class AttributeScreensTest : public ::testing::Test {
protected:
    void SetUp() override {
        char tmpl[] = "/tmp/pelta_shell_attr_XXXXXX";
        dir_ = ::mkdtemp(tmpl);
        ::setenv("PELTA_LOG_FOLDER", (dir_ / "logs").c_str(), 1);
        db_ = (dir_ / "demo.db").string();
        pelta::bll::DemoOptions demo;
        demo.banks = 1;
        demo.rateDays = 1;
        demo.currenciesPerRate = 1;
        demo.partners = 0;
        demo.items = 0;
        pelta::bll::createDemoDatabase(db_, demo);
        FrameworkOptions fo;
        fo.database = db_;
        provider_ = std::make_unique<ThingsProvider>(frameworkListAdapter(fo));
        SessionOptions so;
        so.reapInterval = std::chrono::hours(1);
        sessions_ = std::make_unique<SessionManager>(*provider_, so);
        api_ = std::make_unique<Api>(*sessions_, ApiOptions{});
        session_ = ok("POST", "/api/session", "{}")["session"];

        int64_t list = ok("POST", "/api/lists", R"({"id":"test.ctxThings"})")["id"];
        uint64_t after = live().events().lastSequence();
        EXPECT_EQ(ok("POST", path(list, "execute"), R"({"command":102})")["handled"], true);
        detail_ = nextEvent(live().events(), "screen", after)["screen"];
    }

    void TearDown() override {
        api_.reset();
        sessions_.reset();
        provider_.reset();
        ::unsetenv("PELTA_LOG_FOLDER");
        std::error_code ec;
        fs::remove_all(dir_, ec);
    }

    ApiResponse call(const std::string& method, const std::string& path,
                     const std::string& body = {}) {
        return api_->handle(ApiRequest{method, path, {}, body, session_});
    }
    json ok(const std::string& method, const std::string& path, const std::string& body = {}) {
        ApiResponse r = call(method, path, body);
        EXPECT_LT(r.status, 300) << method << " " << path << ": " << r.body;
        return json::parse(r.body);
    }
    int status(const std::string& action, const json& body) {
        return call("POST", path(detail_, action), body.dump()).status;
    }
    Session& live() { return *sessions_->find(session_); }
    static std::string path(int64_t screen, const std::string& action = {}) {
        return "/api/screens/" + std::to_string(screen) + (action.empty() ? "" : "/" + action);
    }

    json screen() { return ok("GET", path(detail_)); }
    json row(const std::string& field) {
        const json s = screen();
        for (const json& r : s["attributeGrids"][0]["rows"])
            if (r["field"] == field) return r;
        throw std::runtime_error("no attribute " + field);
    }
    bool set(const std::string& field, const json& value) {
        return ok("POST", path(detail_, "attributes"),
                  json{{"grid", "agAttribs"}, {"field", field}, {"value", value}}.dump())["ok"];
    }

    fs::path dir_;
    std::string db_;
    std::unique_ptr<ThingsProvider> provider_;
    std::unique_ptr<SessionManager> sessions_;
    std::unique_ptr<Api> api_;
    std::string session_;
    int64_t detail_ = 0;
};

TEST_F(AttributeScreensTest, TheDetailScreenDescribesItsAttributesAndTree) {
    json s = screen();
    ASSERT_EQ(s["attributeGrids"].size(), 1u);
    const json& g = s["attributeGrids"][0];
    EXPECT_EQ(g["name"], "agAttribs");
    ASSERT_EQ(g["groups"].size(), 3u);
    EXPECT_EQ(g["groups"][1], (json{{"number", 2}, {"caption", "Мерки"}}));
    ASSERT_EQ(g["rows"].size(), 8u);

    auto find = [&](const std::string& field) {
        for (const json& r : g["rows"])
            if (r["field"] == field) return r;
        throw std::runtime_error("no attribute " + field);
    };
    json name2 = find("Name2");
    EXPECT_EQ(name2["editor"], "text");
    EXPECT_EQ(name2["style"], "Required");  // given by the screen
    EXPECT_EQ(name2["help"], "Име на чужд език.");
    json currency = find("Currency_ID");
    EXPECT_EQ(currency["editor"], "list");
    EXPECT_EQ(currency["value"], kUsd);
    EXPECT_EQ(currency["text"], "USD");
    ASSERT_EQ(currency["options"].size(), 2u);
    EXPECT_EQ(currency["options"][1], (json{{"key", kEur}, {"text", "EUR"}, {"parent", ""}}));
    json make = find("PriceMake");
    EXPECT_EQ(make["editor"], "fixedlist");
    EXPECT_EQ(make["text"], "(Няма)");
    EXPECT_EQ(make["options"][2]["key"], "2");
    json neto = find("WeightNeto");
    EXPECT_EQ(neto["editor"], "number");
    EXPECT_EQ(neto["text"], "1.000");
    EXPECT_EQ(find("IsPacking")["editor"], "check");
    EXPECT_EQ(find("IsPacking")["value"], false);
    EXPECT_EQ(find("SecItm_ID")["editor"], "selector");
    json tree = find("FinStruct_ID");
    EXPECT_EQ(tree["editor"], "treelist");
    EXPECT_EQ(tree["options"][1]["parent"], kRoot);

    ASSERT_EQ(s["trees"].size(), 1u);
    EXPECT_EQ(s["trees"][0]["name"], "tvLists");
    EXPECT_EQ(s["trees"][0]["nodes"][1],
              (json{{"parent", "nLists"}, {"key", "nBarcodes"}, {"text", "Баркодове"}}));
    EXPECT_EQ(s["trees"][0]["selected"], "");
    // The barcodes grid is bound when its node is first shown.
    for (const json& grid : s["grids"])
        EXPECT_NE(grid["name"], "geBarcodes");
}

TEST_F(AttributeScreensTest, EnteredValuesAreConvertedAndEventsSeen) {
    EXPECT_TRUE(set("WeightNeto", "1,5"));
    json neto = row("WeightNeto");
    EXPECT_EQ(neto["text"], "1.500");
    EXPECT_EQ(row("WeightBruto")["text"], "3.000");  // changed by the screen's AfterUpdate

    EXPECT_TRUE(set("Currency_ID", kEur));
    EXPECT_EQ(row("Currency_ID")["text"], "EUR");
    EXPECT_TRUE(set("PriceMake", 2));
    EXPECT_EQ(row("PriceMake")["text"], "На база тегло");
    EXPECT_TRUE(set("IsPacking", true));
    EXPECT_EQ(row("IsPacking")["value"], true);
    EXPECT_TRUE(set("Name2", "Screw"));
    EXPECT_EQ(row("Name2")["style"], "");

    // Refusals answer ok false and keep the value.
    EXPECT_FALSE(set("WeightNeto", "много"));
    EXPECT_FALSE(set("Currency_ID", kRoot));
    EXPECT_FALSE(set("PriceMake", "7"));
    EXPECT_FALSE(set("Name2", "забранено"));  // cancelled by the screen
    EXPECT_EQ(row("WeightNeto")["text"], "1.500");
    EXPECT_EQ(row("Currency_ID")["value"], kEur);
    EXPECT_EQ(row("PriceMake")["value"], 2);
    EXPECT_EQ(row("Name2")["value"], "Screw");
    EXPECT_TRUE(set("Currency_ID", nullptr));
    EXPECT_TRUE(row("Currency_ID")["value"].is_null());
}

TEST_F(AttributeScreensTest, TheSelectorButtonLetsTheScreenPick) {
    EXPECT_EQ(ok("POST", path(detail_, "attributebutton"),
                 R"({"grid":"agAttribs","field":"SecItm_ID"})")["ok"],
              true);
    json sec = row("SecItm_ID");
    EXPECT_EQ(sec["value"], kSet);
    EXPECT_EQ(sec["text"], "Комплект");
    // A selector's value comes from its button, a button only from a selector.
    EXPECT_EQ(status("attributes", {{"field", "SecItm_ID"}, {"value", kSet}}), 400);
    EXPECT_EQ(status("attributebutton", {{"field", "Name2"}}), 400);
}

TEST_F(AttributeScreensTest, TheChosenRowGivesTheHelpText) {
    EXPECT_EQ(ok("POST", path(detail_, "attributeselect"),
                 R"({"grid":"agAttribs","field":"PriceMake"})")["ok"],
              true);
    json g = screen()["attributeGrids"][0];
    EXPECT_EQ(g["selected"], "PriceMake");
    EXPECT_EQ(g["help"], "Използва се при [b]Печат на ценови оферти[/b].");
    ok("POST", path(detail_, "attributeselect"), R"({"field":"WeightNeto"})");  // the first grid
    EXPECT_EQ(screen()["attributeGrids"][0]["help"], "");
}

TEST_F(AttributeScreensTest, ANodeClickedActivatesItsLists) {
    EXPECT_EQ(
        ok("POST", path(detail_, "activate"), R"({"tree":"tvLists","key":"nBarcodes"})")["ok"],
        true);
    json s = screen();
    EXPECT_EQ(s["trees"][0]["selected"], "nBarcodes");
    bool bound = false;
    for (const json& grid : s["grids"])
        bound = bound || grid["name"] == "geBarcodes";
    EXPECT_TRUE(bound);
}

TEST_F(AttributeScreensTest, MalformedRequestsAreRefused) {
    EXPECT_EQ(status("attributes", {{"grid", "agOther"}, {"field", "Name2"}, {"value", "x"}}), 400);
    EXPECT_EQ(status("attributes", {{"field", "Unknown"}, {"value", "x"}}), 400);
    EXPECT_EQ(status("attributes", {{"field", "Name2"}}), 400);  // no value
    EXPECT_EQ(status("attributes", {{"field", 5}, {"value", "x"}}), 400);
    EXPECT_EQ(status("attributes", {{"field", "Name2"}, {"value", json::array({1})}}), 400);
    EXPECT_EQ(status("attributes", {{"field", "Name2"}, {"value", true}}), 400);
    EXPECT_EQ(status("attributes", {{"field", "IsPacking"}, {"value", "да"}}), 400);
    EXPECT_EQ(status("attributes", {{"field", "Name2"}, {"value", std::string(100001, 'x')}}), 400);
    EXPECT_EQ(status("attributeselect", {{"grid", "agAttribs"}}), 400);
    EXPECT_EQ(status("activate", {{"tree", "tvLists"}, {"key", "nOther"}}), 400);
    EXPECT_EQ(status("activate", {{"tree", "tvOther"}, {"key", "nLists"}}), 400);
    EXPECT_EQ(status("activate", {{"tree", "tvLists"}}), 400);
    EXPECT_EQ(call("GET", path(detail_, "activate")).status, 405);
    // A list has neither attribute grids nor trees.
    EXPECT_EQ(call("POST", path(1, "attributes"), R"({"field":"Name2","value":"x"})").status, 400);
    EXPECT_EQ(call("POST", path(1, "activate"), R"({"key":"nLists"})").status, 400);
    EXPECT_EQ(call("POST", "/api/screens/99/activate", R"({"key":"nLists"})").status, 404);
    // Nothing changed on the way.
    EXPECT_TRUE(row("Name2")["value"].is_null());
    EXPECT_EQ(screen()["trees"][0]["selected"], "");
}

}  // namespace
}  // namespace pelta::shell
