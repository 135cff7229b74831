// The item's bills of materials (recipes): one tree node each under
// "Производство и придобиване", their rows in one grid, and the commands
// that add, rename, copy and delete them and recalculate their prices.
#include "library/contracts/Constants.h"
#include "library/frame/mdBllCall.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/items/frmItemsDetails.h"
#include "library/items/mdLiveRows.h"
#include "platform/automation/guid.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kObjectName = "frmItemsDetails";
constexpr const char* kBomsNode = "Производство и придобиване";
constexpr const char* kBomPrefix = "Bom:";
constexpr const char* kBomTitle = "Рецепта";

enum BomCommand : int32_t {
    kCmdNewBom = 117,
    kCmdEditBom = 243,
    kCmdCopyBom = 310,
    kCmdBomPrices = 340,
    kCmdBomPartPrices = 323,
};

}  // namespace

bool frmItemsDetails::BomNameTaken(const RecordsetRef& Boms, const std::string& Name,
                                   const std::string& Except) {
    if (!Boms || Boms->fieldIndex("Name") < 0) return false;
    bool taken = false;
    ForLiveRows(
        Boms, [&](pelta::Recordset& b) { taken = taken || C2Str(b.value("ID")) != Except; },
        "Name='" + SqlQuote(Name) + "'");
    return taken;
}

std::string frmItemsDetails::pvBomOfNode(const std::string& Key) const {
    return Key.rfind(kBomPrefix, 0) == 0 ? Key.substr(std::string_view(kBomPrefix).size())
                                         : std::string();
}

// One node "Рецепта %1" per bill, the active ones first, then by name.
void frmItemsDetails::pvBomNodes() {
    auto boms = Rows("Boms");
    if (!boms || boms->recordCount() == 0 || boms->fieldIndex("Name") < 0) return;
    auto b = boms->clone();
    b->setSort("IsActive DESC, Name");
    for (b->moveFirst(); !b->eof(); b->moveNext()) {
        if (b->status() == pelta::RowStatus::Deleted) continue;
        m_oTreeExt->AddNode(kBomsNode, kBomPrefix + C2Str(b->value("ID")),
                            Printf("Рецепта %1", C2Str(b->value("Name"))));
    }
}

void frmItemsDetails::pvEnableBomCommands() {
    const bool onBom = !pvBomOfNode(m_sNode).empty();
    for (int32_t id : {kCmdEditBom, kCmdCopyBom, kCmdBomPrices, kCmdBomPartPrices})
        m_oForm->EnableCommand(id, onBom);
}

bool frmItemsDetails::pvBomCommand(int32_t CommandID) {
    switch (CommandID) {
        case kCmdNewBom:
            pvNewBom();
            return true;
        case kCmdEditBom:
            pvRenameBom();
            return true;
        case kCmdCopyBom:
            pvCopyBom();
            return true;
        case kCmdBomPrices:
        case kCmdBomPartPrices:
            pvBomPrices();
            return true;
        default:
            return false;
    }
}

namespace {

// The name the person types for a bill, unique among the item's bills;
// empty when the person gave up.
std::string AskBomName(IFormExtender& Form, const RecordsetRef& Boms, std::string Default,
                       const std::string& Except) {
    for (;;) {
        pelta::Variant value(Default);
        if (!Form.InputBox("Име на рецепта:", kBomTitle, value)) return {};
        std::string name = C2Str(value);
        const auto b = name.find_first_not_of(' ');
        name = b == std::string::npos ? std::string()
                                      : name.substr(b, name.find_last_not_of(' ') - b + 1);
        if (name.empty()) return {};
        if (!frmItemsDetails::BomNameTaken(Boms, name, Except)) return name;
        Form.MsgBox(Printf("Вече съществува рецепта с име '%1'.", name), vbExclamation, kBomTitle);
        Default = name;
    }
}

}  // namespace

void frmItemsDetails::pvNewBom() {
    auto boms = Rows("Boms");
    if (!boms || boms->fieldIndex("Name") < 0) return;
    const std::string name = AskBomName(*m_oForm, boms, {}, {});
    if (name.empty()) return;
    const bool first = LiveBookmarks(boms).empty();
    const std::string id = pelta::newGuidString();
    auto set = [&](const char* field, const pelta::Variant& v) {
        if (boms->fieldIndex(field) >= 0) boms->setValue(field, v);
    };
    boms->addNew();
    set("ID", pelta::Variant(id));
    set("Itm_ID", pelta::Variant(C2Str(m_rsHead->value("ID"))));
    set("Name", pelta::Variant(name));
    set("IsActive", pelta::Variant(true));
    set("IsDefault", pelta::Variant(first));
    set("Quantity", pelta::Variant(pelta::Decimal(1)));
    set("NumRows", pelta::Variant(0));
    set("CU", pelta::Variant(m_oConnection->CurrentUserID()));
    set("CD", pelta::Variant(pelta::now()));
    boms->update();
    m_sNode = kBomPrefix + id;
    pvBuildTree();
}

void frmItemsDetails::pvRenameBom() {
    const std::string bom = pvBomOfNode(m_sNode);
    auto boms = Rows("Boms");
    if (bom.empty() || !boms) return;
    auto b = boms->clone();
    if (!b->find("ID='" + SqlQuote(bom) + "'")) return;
    const std::string name = AskBomName(*m_oForm, boms, C2Str(b->value("Name")), bom);
    if (name.empty() || name == C2Str(b->value("Name"))) return;
    b->setValue("Name", pelta::Variant(name));
    b->update();
    pvBuildTree();
}

// A copy of the chosen bill with its rows, under a name of its own.
void frmItemsDetails::pvCopyBom() {
    const std::string bom = pvBomOfNode(m_sNode);
    auto boms = Rows("Boms");
    if (bom.empty() || !boms) return;
    auto source = boms->clone();
    if (!source->find("ID='" + SqlQuote(bom) + "'")) return;
    const std::string name = AskBomName(*m_oForm, boms, C2Str(source->value("Name")) + " (2)", {});
    if (name.empty()) return;
    const std::string id = pelta::newGuidString();
    boms->addNew();
    for (size_t i = 0; i < boms->fieldCount(); ++i) {
        const std::string& field = boms->fieldDef(i).name;
        if (field == "LU" || field == "LD") continue;
        boms->setValue(field, source->value(field));
    }
    boms->setValue("ID", pelta::Variant(id));
    boms->setValue("Name", pelta::Variant(name));
    if (boms->fieldIndex("IsDefault") >= 0) boms->setValue("IsDefault", pelta::Variant(false));
    if (boms->fieldIndex("CU") >= 0)
        boms->setValue("CU", pelta::Variant(m_oConnection->CurrentUserID()));
    if (boms->fieldIndex("CD") >= 0) boms->setValue("CD", pelta::Variant(pelta::now()));
    boms->update();
    if (auto details = Rows("BomsDetails"); details && details->fieldIndex("Bom_ID") >= 0) {
        auto d = details->clone();
        for (const pelta::Variant& mark :
             LiveBookmarks(details, "Bom_ID='" + SqlQuote(bom) + "'")) {
            d->setBookmark(mark);
            details->addNew();
            for (size_t i = 0; i < details->fieldCount(); ++i) {
                const std::string& field = details->fieldDef(i).name;
                if (field != "LU" && field != "LD") details->setValue(field, d->value(field));
            }
            details->setValue("ID", pelta::Variant(pelta::newGuidString()));
            details->setValue("Bom_ID", pelta::Variant(id));
            details->update();
        }
    }
    m_sNode = kBomPrefix + id;
    pvBuildTree();
}

void frmItemsDetails::pvDeleteBom() {
    const std::string bom = pvBomOfNode(m_sNode);
    auto boms = Rows("Boms");
    if (bom.empty() || !boms) return;
    auto b = boms->clone();
    if (!b->find("ID='" + SqlQuote(bom) + "'")) return;
    if (m_oForm->AskYesNo(Printf("Желаете ли да изтриете '%1'?", C2Str(b->value("Name")))) != vbYes)
        return;
    if (auto details = Rows("BomsDetails"); details && details->fieldIndex("Bom_ID") >= 0) {
        auto d = details->clone();
        for (const pelta::Variant& mark :
             LiveBookmarks(details, "Bom_ID='" + SqlQuote(bom) + "'")) {
            d->setBookmark(mark);
            d->deleteRecord();
        }
    }
    b->deleteRecord();
    if (m_sBom == bom) m_sBom.clear();
    m_sNode = kBomsNode;
    pvBuildTree();
}

// The service prices the bills of a saved item: unsaved edits are saved
// first, and the item is read again afterwards.
void frmItemsDetails::pvBomPrices() {
    if (Key().empty() || pvModified()) {
        if (!m_oForm->SaveDocument()) return;
    }
    if (Key().empty()) return;
    auto request = CreatePropertyBag(m_oForm.get());
    request->writeProperty("Itm_ID", pelta::Variant(Key()));
    if (!CallBll(m_oForm.get(), m_oConnection.get(), "UpdNomItemsBomPrices", request.get())) return;
    m_oForm->Refresh();
}

}  // namespace PeltaNom15
