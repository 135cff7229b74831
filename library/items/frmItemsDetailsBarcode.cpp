// The item editor's barcode preview: the barcode of the chosen row of the
// barcodes grid drawn with the options beside it, and saved as a Windows
// metafile (10006).
#include <filesystem>
#include <fstream>
#include <string_view>

#include "library/contracts/Constants.h"
#include "library/frame/Declarations.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/items/frmItemsDetails.h"
#include "library/items/mdBarcodeImage.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

// "value|text|value|text..." (frmItemsDetailsLists.cpp).
RecordsetRef FixedRows(std::string_view Values);

namespace {

constexpr const char* kObjectName = "frmItemsDetails";
constexpr const char* kNode = "Баркодове";

constexpr const char* kPicture = "imgBarCode";
constexpr const char* kMessage = "lblBarCode";
constexpr const char* kCode = "txtBarCode";
constexpr const char* kType = "cboBarCodeType";
constexpr const char* kHeight = "cboBarCodeHeight";
constexpr const char* kDigits = "chkBarCodeDigits";
constexpr const char* kSeparators = "chkBarCodeSeparators";

// A file name made of the code: characters no folder takes become "_".
std::string FileNameOf(const std::string& Code) {
    std::string name;
    for (char ch : Code)
        name += std::string_view("\\/:*?\"<>|").find(ch) != std::string_view::npos ||
                        static_cast<unsigned char>(ch) < 0x20
                    ? '_'
                    : ch;
    if (name.empty() || name == "." || name == "..") name = "barcode";
    return name + ".wmf";
}

}  // namespace

// The options and the preview sit in the barcodes' node.
std::vector<ControlDecl> ItemBarcodeControls() {
    auto shown = [](ControlDecl c) {
        c.ReadOnly = true;
        return c;
    };
    return {
        Control(kCode, ControlKind::Text, "Баркод", {}, kNode),
        Control(kType, ControlKind::Combo, "Тип", {}, kNode),
        Control(kHeight, ControlKind::Combo, "Височина", {}, kNode),
        Control(kDigits, ControlKind::CheckBox, "Цифри", {}, kNode),
        Control(kSeparators, ControlKind::CheckBox, "Сепаратори", {}, kNode),
        shown(Control(kMessage, ControlKind::Label, {}, {}, kNode)),
        shown(Control(kPicture, ControlKind::Picture, {}, {}, kNode)),
    };
}

bool frmItemsDetails::pvCreateBarCodePreview() {
    m_oForm->SetControlList(kType, FixedRows("0|(Auto)|1|EAN-13|2|EAN-8|3|EAN-128|4|UPC-A|5|UPC-E"),
                            "ID", {"Name"});
    m_oForm->SetControlList(
        kHeight,
        FixedRows("200|200%|150|150%|120|120%|100|100%|90|90%|80|80%|70|70%|60|60%|50|50%|40|40%|"
                  "30|30%|20|20%"),
        "ID", {"Name"});
    m_oForm->SetControlValue(kType, pelta::Variant(int32_t{bctAuto}));
    m_oForm->SetControlValue(kHeight, pelta::Variant(100));
    m_oForm->SetControlValue(kDigits, pelta::Variant(true));
    m_oForm->SetControlValue(kSeparators, pelta::Variant(true));
    for (const char* name : {kCode, kType, kHeight, kDigits, kSeparators}) {
        auto field = CreateFieldExtender(m_oForm.get(), name);
        if (!field) return false;
        field->Events().Change = [this] {
            try {
                pvDrawBarCode();
            } catch (...) {
                ShowError("m_oBarCodeOption_Change", kObjectName, m_oDef.Caption);
            }
        };
        m_oBarCodeFields.push_back(field);
    }
    auto& grid = m_oGrids["geBarCodes"]->Events();
    grid.RowColChange = [this](const pelta::Variant&, const std::string&) {
        try {
            pvBarCodeRow();
        } catch (...) {
            ShowError("m_oGridBarCodes_RowColChange", kObjectName, m_oDef.Caption);
        }
    };
    // The row being typed is drawn as it changes.
    grid.AfterColUpdate = [this](const std::string& Column) {
        if (Column != "Code" && Column != "Type") return;
        try {
            pvBarCodeRow();
        } catch (...) {
            ShowError("m_oGridBarCodes_AfterColUpdate", kObjectName, m_oDef.Caption);
        }
    };
    m_oForm->AddCommand(kCmdSaveBarCode, "Запазване баркод...", "Баркод");
    return true;
}

// The options take the chosen row's code and type; a weight template or a
// row without a type is drawn as (Auto) would.
void frmItemsDetails::pvBarCodeRow() {
    IGridExtender* grid = m_oGrids["geBarCodes"].get();
    std::string code;
    int32_t type = bctAuto;
    if (grid->HasCurrentRow()) {
        code = C2Str(grid->CurrentValue("Code"));
        type = C2Lng(grid->CurrentValue("Type"));
        if (BarCodeTypeName(type).empty() || type == bctWeight) type = bctAuto;
    }
    m_oForm->SetControlValue(kCode, pelta::Variant(code));
    m_oForm->SetControlValue(kType, pelta::Variant(type));
    pvDrawBarCode();
}

BarcodeImage frmItemsDetails::pvBarCodeImage(bool Metafile) {
    BarcodeImageOptions o;
    o.Type = C2Lng(m_oForm->ControlValue(kType));
    const int32_t height = C2Lng(m_oForm->ControlValue(kHeight));
    o.HeightPercent = height > 0 ? height : 100;
    o.Digits = C2Bool(m_oForm->ControlValue(kDigits));
    o.Separators = C2Bool(m_oForm->ControlValue(kSeparators));
    return DrawBarcodeImage(C2Str(m_oForm->ControlValue(kCode)), o, Metafile);
}

// A code its type cannot take shows why instead of an image.
void frmItemsDetails::pvDrawBarCode() {
    const BarcodeImage image = pvBarCodeImage(false);
    m_oForm->SetControlValue(kPicture,
                             image.Drawn() ? pelta::Variant(image.Svg) : pelta::Variant());
    m_oForm->SetControlValue(kMessage, pelta::Variant(image.Message));
}

void frmItemsDetails::pvEnableBarCodeCommand() {
    m_oForm->EnableCommand(kCmdSaveBarCode, m_sNode == kNode);
}

// The image as a Windows metafile where the person chooses; the folder is
// offered again next time.
void frmItemsDetails::pvSaveBarCode() {
    const std::string code = C2Str(m_oForm->ControlValue(kCode));
    if (code.empty()) {
        m_oForm->MsgBox("Няма баркод за запазване.", vbExclamation);
        return;
    }
    const BarcodeImage image = pvBarCodeImage(true);
    if (!image.Drawn()) {
        m_oForm->MsgBox(image.Message, vbExclamation);
        return;
    }
    std::string path = FileNameOf(code);
    const std::string folder = C2Str(m_oForm->GetSetting("InitialDir", pelta::Variant("")));
    if (!m_oForm->SaveFileDialog("Запазване баркод",
                                 "WMF - Windows Metafiles|*.wmf|Всички файлове (*.*)|*.*", folder,
                                 path) ||
        path.empty())
        return;
    std::ofstream out(path, std::ios::binary | std::ios::trunc);
    out.write(reinterpret_cast<const char*>(image.Metafile.data()),
              static_cast<std::streamsize>(image.Metafile.size()));
    out.close();
    if (!out) {
        m_oForm->MsgBox(Printf("Файлът '%1' не може да бъде записан.", path), vbExclamation);
        return;
    }
    const std::filesystem::path folderChosen = std::filesystem::path(path).parent_path();
    if (!folderChosen.empty())
        m_oForm->SaveSetting("InitialDir", pelta::Variant(folderChosen.string()));
}

}  // namespace PeltaNom15
