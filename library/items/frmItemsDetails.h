// One product, material or service: its head and attributes, the tree of
// the lists kept with it (price lists, measure facets, barcodes, bills of
// materials and the others), and the documents of the suite in which it
// occurs; everything is saved in one call.
#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "library/frame/cDetailFrame.h"

namespace PeltaNom15 {

struct BarcodeImage;

class frmItemsDetails final : public cDetailFrame {
public:
    frmItemsDetails();

    // The sub-lists in the order the service takes them.
    static const std::vector<std::string>& SubLists();
    // Whether a bill of materials of that name is among `Boms` already
    // (`Except` is the bill being renamed).
    static bool BomNameTaken(const RecordsetRef& Boms, const std::string& Name,
                             const std::string& Except = {});

    // The tree of lists: node keys are the captions, but for the price
    // lists ("PriceList"), the bills ("Bom:" + ID) and the placeholder of a
    // new bill.
    ITreeExtender* Tree() const { return m_oTreeExt.get(); }
    static constexpr const char* kNewBomNode = "__empty__Bom";
    // Saves the previewed barcode as a Windows metafile.
    static constexpr int32_t kCmdSaveBarCode = 10006;
    // The list control of another library opened by a document node.
    pelta::ObjectRef DocumentList(const std::string& NodeKey) const;

    void Terminate() override;

private:
    // the record and its lifecycle
    bool pvInitForm() override;
    void pvTakeResponse(pelta::PropertyBag& Response, bool Fetched) override;
    void pvNewRecord() override;
    void pvFillControls() override;
    bool pvIsModified() override;
    bool pvIsCorrect() override;
    void pvUpload() override;
    void pvWriteSaveRequest(pelta::PropertyBag& Request) override;
    SaveRefusal pvSaveRefused(pelta::PropertyBag& Response, pelta::PropertyBag& Request,
                              int32_t Attempt) override;
    bool pvExecute(int32_t CommandID) override;

    bool pvCheckHead();
    bool pvCheckLists();
    bool pvCopy();
    std::string pvAttribute(const char* Field);
    pelta::Variant pvDefault(const char* Reference, const char* Flag = "IsDef");

    // the tree of lists (frmItemsDetailsLists.cpp)
    bool pvCreateLists();
    void pvSetLists();
    void pvBuildTree();
    void pvNodeActivate(const std::string& Key);
    void pvRefreshLots();
    void pvOpenDocuments(const std::string& NodeKey);
    void pvProposePrices();
    void pvPriceWithVat(IGridExtender& Grid, const std::string& Column);
    void pvPickAttribute(const std::string& Field);
    bool pvPickRecord(const std::string& Field);
    std::string pvAttributeCaption(const std::string& Field) const;

    // the barcode preview (frmItemsDetailsBarcode.cpp)
    bool pvCreateBarCodePreview();
    void pvBarCodeRow();
    void pvDrawBarCode();
    BarcodeImage pvBarCodeImage(bool Metafile);
    void pvEnableBarCodeCommand();
    void pvSaveBarCode();

    // bills of materials (frmItemsDetailsBoms.cpp)
    std::string pvBomOfNode(const std::string& Key) const;
    void pvBomNodes();
    bool pvBomCommand(int32_t CommandID);
    void pvNewBom();
    void pvRenameBom();
    void pvCopyBom();
    void pvDeleteBom();
    void pvBomPrices();
    void pvEnableBomCommands();

    // The item a copy (318) is made of: its head values and measure facets.
    struct CopySource {
        std::vector<std::pair<std::string, pelta::Variant>> Head;
        RecordsetRef Measures;
    };
    std::optional<CopySource> m_oCopy;
    bool m_bFromCopy = false;
    bool m_bUploaded = false;  // the head holds the controls' values of a save

    pelta::Ref<ITreeExtender> m_oTreeExt;
    std::vector<pelta::Ref<ISplitterExtender>> m_oSplitters;
    std::string m_sNode;                                       // the chosen node
    std::string m_sBom;                                        // the last bill of materials shown
    std::map<std::string, RecordsetRef> m_oBound;              // grid control → the rows it shows
    std::map<std::string, pelta::ObjectRef> m_oDocs;           // document node → list control
    std::vector<pelta::Ref<IFieldExtender>> m_oBarCodeFields;  // the preview's options
    pelta::ObjectRef m_oItemsSelector;                         // the item attributes' selector
    pelta::ObjectRef m_oPartnersSelector;                      // the partner attributes' selector
};

}  // namespace PeltaNom15
