// The item editor's barcode preview as a person uses it: choosing a barcode
// row draws its code, the options beside the preview redraw it, a code its
// type cannot take says why, and 10006 saves the image as a Windows metafile
// where the person chose, remembering the folder.
#include <filesystem>
#include <fstream>
#include <iterator>

#include "items_details_support.h"
#include "tests/platform/graphics/wmf_reader.h"

namespace screentest {
namespace {

namespace fs = std::filesystem;

constexpr const char* kFilter = "WMF - Windows Metafiles|*.wmf|Всички файлове (*.*)|*.*";

class ItemBarcodeTest : public ItemDetailsTest {
protected:
    // A demo item with its two EAN-13 barcodes, the barcodes' node shown.
    frmItemsDetails* withBarcodes() {
        auto* d = openItem("0000007");
        EXPECT_NE(d, nullptr);
        if (!d) return nullptr;
        EXPECT_TRUE(d->Tree()->SelectNode("Баркодове"));
        return d;
    }
    std::string value(frmItemsDetails* d, const std::string& control) {
        return C2Str(f(d)->ControlValue(control));
    }
    std::string picture(frmItemsDetails* d) { return value(d, "imgBarCode"); }
    pelta::fw::GridExtender* barcodes(frmItemsDetails* d) { return grid(d->Grid("geBarCodes")); }
    std::vector<std::string> codes(frmItemsDetails* d) {
        std::vector<std::string> out;
        auto r = d->Rows("BarCodes")->clone();
        for (r->moveFirst(); !r->eof(); r->moveNext())
            out.push_back(C2Str(r->value("Code")));
        return out;
    }
    bool enabled(frmItemsDetails* d, int32_t command) {
        const auto* c = f(d)->command(command);
        return c && c->enabled;
    }
    static std::vector<uint8_t> bytesOf(const fs::path& p) {
        std::ifstream in(p, std::ios::binary);
        return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
    }
};

TEST_F(ItemBarcodeTest, TheChosenRowsBarcodeIsPreviewed) {
    auto* d = withBarcodes();
    ASSERT_NE(d, nullptr);
    const auto all = codes(d);
    ASSERT_EQ(all.size(), 2u);
    auto* g = barcodes(d);
    const std::string first = C2Str(g->CurrentValue("Code"));
    EXPECT_EQ(value(d, "txtBarCode"), first);
    EXPECT_EQ(C2Lng(f(d)->ControlValue("cboBarCodeType")), 1) << "the row's EAN-13";
    EXPECT_EQ(picture(d).rfind("<svg", 0), 0u);
    EXPECT_NE(picture(d).find(">" + first.substr(1, 6) + "</text>"), std::string::npos);
    EXPECT_EQ(value(d, "lblBarCode"), "");
    EXPECT_TRUE(enabled(d, frmItemsDetails::kCmdSaveBarCode));

    const std::string second = all[0] == first ? all[1] : all[0];
    ASSERT_TRUE(g->MoveToRow("Code = '" + second + "'"));
    EXPECT_EQ(value(d, "txtBarCode"), second);
    EXPECT_NE(picture(d).find(">" + second.substr(1, 6) + "</text>"), std::string::npos);
    EXPECT_FALSE(f(d)->isModified()) << "the preview changes nothing of the item";

    ASSERT_TRUE(d->Tree()->SelectNode("PriceList"));
    EXPECT_FALSE(enabled(d, frmItemsDetails::kCmdSaveBarCode))
        << "saving a barcode belongs to the barcodes' node";
}

TEST_F(ItemBarcodeTest, OptionsRedrawThePreview) {
    auto* d = withBarcodes();
    ASSERT_NE(d, nullptr);
    const std::string usual = picture(d);
    f(d)->userSetValue("chkBarCodeDigits", pelta::Variant(false));
    EXPECT_EQ(picture(d).find("<text"), std::string::npos);
    f(d)->userSetValue("chkBarCodeDigits", pelta::Variant(true));
    EXPECT_EQ(picture(d), usual);

    f(d)->userSetValue("cboBarCodeHeight", pelta::Variant("200"));
    EXPECT_GT(picture(d).size(), 0u);
    EXPECT_NE(picture(d), usual);
    f(d)->userSetValue("chkBarCodeSeparators", pelta::Variant(false));
    const std::string flat = picture(d);
    f(d)->userSetValue("chkBarCodeSeparators", pelta::Variant(true));
    EXPECT_NE(picture(d), flat);

    // A type the code does not fit: the reason instead of an image.
    const std::string code = value(d, "txtBarCode");
    f(d)->userSetValue("cboBarCodeType", pelta::Variant("2"));
    EXPECT_EQ(picture(d), "");
    EXPECT_EQ(value(d, "lblBarCode"), "Баркодът '" + code +
                                          "' не може да бъде изобразен като EAN-8: очакват се 7 "
                                          "или 8 цифри.");
    f(d)->userSetValue("txtBarCode", pelta::Variant("96385074"));
    EXPECT_EQ(picture(d).rfind("<svg", 0), 0u);
    EXPECT_EQ(value(d, "lblBarCode"), "");
    EXPECT_FALSE(f(d)->isModified());
    EXPECT_TRUE(agent->prompts().empty()) << "the preview asks nothing";
}

TEST_F(ItemBarcodeTest, ARowBeingTypedIsPreviewedAndAWeightTemplateAsAuto) {
    auto* d = withBarcodes();
    ASSERT_NE(d, nullptr);
    auto* g = barcodes(d);
    g->addRow();
    ASSERT_TRUE(g->editCell("Code", pelta::Variant("2900001ww.wwwc")));
    ASSERT_TRUE(g->editCell("Type", pelta::Variant(-1)));
    EXPECT_EQ(value(d, "txtBarCode"), "2900001ww.wwwc");
    EXPECT_EQ(C2Lng(f(d)->ControlValue("cboBarCodeType")), 0);
    EXPECT_NE(picture(d).find(">2900001ww.wwwc</text>"), std::string::npos);
}

TEST_F(ItemBarcodeTest, SavingWritesAMetafileWhereThePersonChoseAndRemembersTheFolder) {
    auto* d = withBarcodes();
    ASSERT_NE(d, nullptr);
    const std::string code = value(d, "txtBarCode");
    const fs::path folder = dir_ / "Етикети";
    fs::create_directories(folder);
    const fs::path file = folder / "баркод.wmf";

    agent->answerSaveFile(file, "Запазване баркод");
    d->FormExtender()->Execute(frmItemsDetails::kCmdSaveBarCode);
    const auto asked = agent->last();
    EXPECT_EQ(asked.kind, pelta::fw::PromptKind::SaveFile);
    EXPECT_EQ(asked.filter, kFilter);
    EXPECT_EQ(asked.fileName, code + ".wmf");
    EXPECT_EQ(asked.initialDir, "");
    const auto w = graphicstest::readWmf(bytesOf(file));
    ASSERT_EQ(w.error, "");
    ASSERT_EQ(w.texts.size(), 3u);
    EXPECT_EQ(w.texts[0].text + w.texts[1].text + w.texts[2].text, code);
    EXPECT_EQ(C2Str(f(d)->GetSetting("InitialDir", {})), folder.string());

    // The folder is offered again; cancelling writes nothing.
    fs::remove(file);
    agent->cancelSaveFile();
    d->FormExtender()->Execute(frmItemsDetails::kCmdSaveBarCode);
    EXPECT_EQ(agent->last().initialDir, folder.string());
    EXPECT_FALSE(fs::exists(file));

    // A file that cannot be written is told, and the folder stays.
    agent->answerSaveFile(dir_ / "няма" / "такава" / "x.wmf");
    d->FormExtender()->Execute(frmItemsDetails::kCmdSaveBarCode);
    EXPECT_EQ(agent->last().text, "Файлът '" + (dir_ / "няма" / "такава" / "x.wmf").string() +
                                      "' не може да бъде записан.");
    EXPECT_EQ(C2Str(f(d)->GetSetting("InitialDir", {})), folder.string());
    EXPECT_EQ(agent->pending(), 0u);
}

TEST_F(ItemBarcodeTest, SavingACodeItsTypeCannotTakeSaysWhyAndAsksNothing) {
    auto* d = withBarcodes();
    ASSERT_NE(d, nullptr);
    f(d)->userSetValue("cboBarCodeType", pelta::Variant("5"));
    agent->clear();
    d->FormExtender()->Execute(frmItemsDetails::kCmdSaveBarCode);
    ASSERT_EQ(agent->prompts().size(), 1u) << "no save-file dialog";
    EXPECT_EQ(agent->last().kind, pelta::fw::PromptKind::MessageBox);
    EXPECT_NE(agent->last().text.find("като UPC-E: очакват се 6, 7 или 8 цифри."),
              std::string::npos);

    f(d)->userSetValue("txtBarCode", pelta::Variant(""));
    agent->clear();
    d->FormExtender()->Execute(frmItemsDetails::kCmdSaveBarCode);
    EXPECT_EQ(agent->last().text, "Няма баркод за запазване.");
}

}  // namespace
}  // namespace screentest
