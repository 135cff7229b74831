// The frame every list control follows: the host creates the control by
// programmatic identifier and hands it the client site; the control shows one
// nomenclature in a grid, creates, opens and deletes records, and opens the
// nomenclature's detail form, one per list, reused between openings.
//
// A list describes itself in a ListDefinition and overrides the hooks for
// what it adds; everything common is here.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "library/contracts/Controls.h"
#include "library/contracts/Extenders.h"
#include "library/contracts/Public.h"
#include "library/frame/IDetailForm.h"
#include "library/frame/LibObject.h"

namespace PeltaNom15 {

struct CommandText {
    int32_t CommandID = 0;
    std::string Caption;  // empty: left as the framework has it
    std::string Tooltip;
};

struct ListDefinition {
    std::string Caption;     // "Валутни курсове"
    std::string ObjectName;  // "ctxRatios"
    int32_t FormHelpID = 0;
    int32_t GridHelpID = 0;
    std::string GridLayoutKey;
    std::string DetailLayoutKey;
    std::string ReadOperation;  // "GetNomCurrRatios"
    std::string ListProperty = "List";
    std::string DeleteOperation;  // "DelNomCurrRatios"
    std::string KeyField = "ID";
    std::string DetailFormClass;  // "frmRatiosDetails"
    std::string GroupColumn;      // the grid's grouping column, may be empty
    std::string GroupValue = "(Всички)";
    std::vector<int32_t> RemovedCommands;
    std::vector<CommandText> Commands;
    std::vector<ColumnDecl> Columns;
};

class cListFrame : public LibObject, public IZonListControl, public IZonTerminate {
public:
    // IZonListControl
    bool InitClientSite(IClientSite* Site) override;
    // IZonTerminate: the cached detail form, then the form extender.
    void QueryTerminate(bool& Cancel) override;
    void Terminate() override;

    // What hosts drive and show.
    IFormExtender* FormExtender() const noexcept { return m_oForm.get(); }
    IGridExtender* GridExtender() const noexcept { return m_oGridExt.get(); }
    RecordsetRef ListRecordset() const;
    const ListDefinition& Definition() const noexcept { return m_oDef; }

protected:
    explicit cListFrame(ListDefinition Def);
    ~cListFrame() override;

    // ---- what a list adds ----
    // After the frame's own initialisation (more extenders, filters, menus).
    virtual void pvInitList() {}
    // Parameters of the read operation.
    virtual void pvWriteFetchRequest(pelta::PropertyBag& Request) {}
    // Takes what the read operation answered; false cancels the fetch. The
    // frame keeps the list property as the list recordset.
    virtual bool pvReadFetchResponse(pelta::PropertyBag& Response);
    // Binds the list recordset to the grid (Fill).
    virtual void pvBindList();
    // Commands of the list, asked before the frame's own; true when performed.
    virtual bool pvExecute(int32_t CommandID) { return false; }
    // The detail form deleted its record: the list reads itself again.
    virtual void pvDetailDeleted();
    // The grid's own delete. Lists whose records may not be deleted that way
    // refuse it (the default); others delete through their operation.
    virtual void m_oGridExt_BeforeDelete(bool& Cancel) { Cancel = true; }

    // ---- shared steps ----
    // The list's detail form: found open, or created and initialised; null
    // when the user may not open details or the form cannot start.
    pelta::Ref<IDetailForm> pvGetDetailForm();
    void pvShowDetails(const std::string& Key);
    void pvDeleteInactive();
    // Puts a row saved in the detail form into the list and shows it.
    void pvMergeListRow(const RecordsetRef& Row);

    ListDefinition m_oDef;
    pelta::Ref<IClientSite> m_oSite;
    pelta::Ref<IBllConnection> m_oConnection;
    pelta::Ref<IFormExtender> m_oForm;
    pelta::Ref<IGridExtender> m_oGridExt;
    pelta::Ref<IDetailOpener> m_oDetailOpener;
    RecordsetRef m_rsList;
    pelta::Ref<IDetailForm> m_oDetailForm;
    int32_t m_lInstanceID = 0;
    std::string m_sInstanceName;

private:
    bool pvInit();
    void m_oForm_Fetch(int32_t Step, bool& Cancel);
    void m_oForm_FillControls();
    void m_oForm_BeforeExecute(int32_t CommandID, bool& Handled);
};

}  // namespace PeltaNom15
