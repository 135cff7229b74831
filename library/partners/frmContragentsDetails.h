// One business partner: its head, the attribute panel, the default partner
// dimension, and the sub-lists kept with it (persons, delivery addresses,
// bank accounts, departments and the lists of other parts of the system),
// all saved in one call.
#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "library/frame/cDetailFrame.h"

namespace PeltaNom15 {

class frmContragentsDetails final : public cDetailFrame {
public:
    frmContragentsDetails();

    // The sub-lists in the order the service takes them.
    static const std::vector<std::string>& SubLists();

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

    // Rules (frmContragentsDetailsRules.cpp).
    void pvSyncDefaultPerson();
    bool pvCheckHead();
    bool pvCheckDimension();
    void pvCaptureCopy();
    void pvTakeCopy();
    bool pvDuplicateCode(pelta::PropertyBag& Response);

    // The default partner dimension.
    void pvBindDimension();
    void pvUploadDimension();
    bool pvDimensionModified();
    RecordsetRef pvDefaultDimension();

    bool pvIsNaturalPersonType(const std::string& TypeID);

    pelta::Ref<ITreeExtender> m_oTreeListsExt;
    pelta::Ref<ISplitterExtender> m_oSplitterTreeExt;
    pelta::Ref<IFieldExtender> m_oTypeFieldExt;
    pelta::Ref<IFieldExtender> m_oNameFieldExt;
    RecordsetRef m_rsDimChoice;  // values of a several-values dimension

    // The partner a copy (318) is made of: its head values and sub-lists.
    struct CopySource {
        std::vector<std::pair<std::string, pelta::Variant>> Head;
        std::map<std::string, RecordsetRef> Rows;
    };
    std::optional<CopySource> m_oCopy;
    bool m_bFromCopy = false;
    // Duplicates the user agreed to during the save in progress.
    bool m_bAgreedBulstat = false;
    bool m_bAgreedTaxNo = false;
};

}  // namespace PeltaNom15
