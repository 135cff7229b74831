// One currency-rate record: the bank, the date and a rate per currency.
#pragma once

#include "library/frame/cDetailFrame.h"

namespace PeltaNom15 {

class frmRatiosDetails final : public cDetailFrame {
public:
    frmRatiosDetails();

    IGridExtender* RowsGrid() const noexcept { return m_oGridExt.get(); }
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
    bool pvShowRowError(pelta::PropertyBag& Response, const std::string& RowID) override;

    void m_oGridExt_BeforeUpdate(bool& Cancel);

    pelta::Ref<IGridExtender> m_oGridExt;
    pelta::Ref<ITabExtender> m_oTabExt;
    pelta::Ref<ISplitterExtender> m_oSplitterAdditionalExt;
    pelta::Ref<ISplitterExtender> m_oSplitterAttribsExt;
    RecordsetRef m_rsRows;
    RecordsetRef m_rsCurrencies;
    RecordsetRef m_rsBanks;
};

}  // namespace PeltaNom15
