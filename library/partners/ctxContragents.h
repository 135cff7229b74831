// The business partners' list: a grid with a filter tree (partner types and
// dimension values), a quick filter, a preview pane, and the partner selector
// of the whole suite.
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

#include "library/contracts/Public.h"
#include "library/frame/cListFrame.h"

namespace PeltaNom15 {

class ctxContragents final : public cListFrame,
                             public IZonSelector,
                             public IZonCgSelector,
                             public IZonGridDimsSelector {
public:
    ctxContragents();

    // Quick-filter fields: the typed text, the chosen dimension values of the
    // tree ("cg-grp", several joined by U+0001) and the chosen partner type.
    static constexpr int32_t kFilterFind = 1;
    static constexpr int32_t kFilterGroup = 2;
    static constexpr int32_t kFilterType = 3;
    // Commands beyond the frame's.
    static constexpr int32_t kCmdEditEmployee = 124;
    static constexpr int32_t kCmdNewEmployee = 126;
    static constexpr int32_t kCmdPreview = 1110;

    // IZonSelector
    bool ShowSelect(pelta::Variant& CurrentValue, pelta::Variant& SearchText,
                    pelta::Variant& Result) override;
    bool GetNextItem(pelta::Variant& ID, pelta::Variant& Name, pelta::Variant& Item) override;
    bool QuickFind(const std::string& Text, pelta::Variant& Result) override;
    bool Reset() override;
    // IZonCgSelector
    bool InitCgType(const std::string& Types, const std::string& SecondRestriction) override;
    bool InitDimValue(const std::string& Dimension, const std::string& Value) override;
    bool InitMedia(const std::string& Media, const std::string& Value) override;
    // IZonGridDimsSelector: 0 is the default partner dimension's column, 1...
    // the columns of the dimensions in their order.
    std::string GetColumnName(int32_t Index) override;

    void Terminate() override;

    // What hosts drive and show.
    ITreeExtender* FilterTree() const noexcept { return m_oTreeExt.get(); }
    IQuickFilterExtender* QuickFilter() const noexcept { return m_oQuickFilterExt.get(); }
    bool NeedsRefetch() const noexcept { return m_bRefetch; }
    bool PreviewPane() const noexcept { return m_bPreviewPane; }
    // The caption of the group the tree filter shows ("София (REG)").
    const std::string& GroupCaption() const noexcept { return m_sGroupCaption; }

    // Loyalty cards as stored (U+007F before, between and after the numbers)
    // as shown: "1234; 5678". A value shorter than two characters is empty.
    static std::string PosCardsText(std::string_view Stored);
    // The row filter of the quick filter's typed text, and of the tree's
    // chosen dimension values (empty: no filter).
    std::string FindClause(const std::string& Text);
    std::string GroupClause(const std::string& Values);

private:
    void pvInitList() override;
    void pvWriteFetchRequest(pelta::PropertyBag& Request) override;
    bool pvReadFetchResponse(pelta::PropertyBag& Response) override;
    bool pvExecute(int32_t CommandID) override;

    void pvBuildTree();
    void pvDeclareColumns();
    void m_oTreeExt_NodeActivate(const std::string& Key);
    void m_oGridExt_FetchData(const pelta::Variant& Bookmark, const std::string& Column,
                              pelta::Variant& Value);
    void m_oGridExt_RowColChange();
    void m_oQuickFilterExt_FilterClause(int32_t FilterID, const std::string& Text,
                                        std::string& Clause, bool& Handled);
    std::string pvAddressClause(const std::string& Text);
    // The keys of the marked rows, else of the current row.
    std::vector<std::string> pvSelectedKeys();
    void pvOpen();
    void pvOpenEmployee(const std::string& Key);
    bool pvOpenForm(const std::string& ClassName, const std::string& Key);
    // Rows of the list matching a criterion: the one bookmark when exactly
    // one matches, else Empty.
    pelta::Variant pvSingleRow(const std::string& Criterion);
    bool pvEnsureList();

    pelta::Ref<ITreeExtender> m_oTreeExt;
    pelta::Ref<IQuickFilterExtender> m_oQuickFilterExt;
    pelta::Ref<ISplitterExtender> m_oSplitterExt;
    pelta::Ref<IDetailForm> m_oOtherForm;  // the multi-partner or employee editor
    RecordsetRef m_rsTypes;
    RecordsetRef m_rsDimensions;
    RecordsetRef m_rsDimValues;
    RecordsetRef m_rsDimMedia;
    RecordsetRef m_rsCustomFormats;
    RecordsetRef m_rsRow;  // reads rows by bookmark for computed columns

    // Selector restrictions; a change asks for a new fetch on the next show.
    std::string m_sCgTypes;
    std::string m_sCgTypes2;
    std::string m_sDimension;
    std::string m_sDimValue;
    std::string m_sMedia;
    std::string m_sMediaValue;
    bool m_bRefetch = false;

    std::vector<pelta::Variant> m_vChosen;  // bookmarks of the chosen rows
    size_t m_lNextItem = 0;
    bool m_bPreviewPane = true;
    std::string m_sGroupCaption;
};

}  // namespace PeltaNom15
