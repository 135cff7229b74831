// One product, material or service: its head, the attributes kept on it, and
// the lists saved with it (measure facets, barcodes, suppliers' codes and
// the lists of other parts of the system), all in one call.
#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "library/frame/cDetailFrame.h"

namespace PeltaNom15 {

class frmItemsDetails final : public cDetailFrame {
public:
    frmItemsDetails();

    // The sub-lists in the order the service takes them.
    static const std::vector<std::string>& SubLists();
    // Whether a bill of materials of that name is among `Boms` already.
    static bool BomNameTaken(const RecordsetRef& Boms, const std::string& Name);

    // What hosts drive and show.
    void Terminate() override;

private:
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
    pelta::Variant pvParameter(const char* Name);
    std::string pvText(const std::string& ControlName);
    pelta::Variant pvDefault(const char* Reference, const char* Flag = "IsDef");

    // The item a copy (318) is made of: its head values and measure facets.
    struct CopySource {
        std::vector<std::pair<std::string, pelta::Variant>> Head;
        RecordsetRef Measures;
    };
    std::optional<CopySource> m_oCopy;
    bool m_bFromCopy = false;
    bool m_bUploaded = false;  // the head holds the controls' values of a save
};

}  // namespace PeltaNom15
