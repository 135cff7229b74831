// The list of products, materials and services, and the suite's item
// selector: prices, availability and discounts computed from the extra result
// sets, filter bands, quick find with code, barcode, weight-barcode and
// supplier-code prefixes, and the preview pane.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "library/frame/cListFrame.h"
#include "library/items/ctxItemsPrices.h"

namespace PeltaNom15 {

class cItemsQuickFind;

class ctxItems final : public cListFrame,
                       public IZonSelector,
                       public IZonItemsSelector,
                       public IZonGridDimsSelector {
public:
    ctxItems();
    ~ctxItems() override;

    // IZonListControl: the first call initialises; later calls (the control
    // reused as a selector) read "MultiSelect", "QuickFindText" and
    // "CurrentValue" from the site and refresh.
    bool InitClientSite(IClientSite* Site) override;
    void QueryTerminate(bool& Cancel) override;
    void Terminate() override;

    // IZonSelector
    bool ShowSelect(pelta::Variant& CurrentValue, pelta::Variant& SearchText,
                    pelta::Variant& Result) override;
    bool GetNextItem(pelta::Variant& ID, pelta::Variant& Name, pelta::Variant& Item) override;
    bool QuickFind(const std::string& Text, pelta::Variant& Result) override;
    bool Reset() override;

    // IZonItemsSelector
    void InitFilter(const std::string& PriceListType, const std::string& Currency,
                    const std::string& Measure, const std::string& Supplier,
                    const std::string& DiscountSchema, const std::string& Store) override;
    bool InitMedia(const std::string& Type, const std::string& Value) override;
    bool InitDimValue(const std::string& Dimension, const std::string& Value) override;
    bool GetItemInfo(const std::string& ID, pelta::Ref<pelta::Recordset>& Prices,
                     pelta::Ref<pelta::Recordset>& MeasureRatios) override;
    std::string DiscountSchema() override;
    std::string PriceListType() override;

    // IZonGridDimsSelector
    std::string GetColumnName(int32_t Index) override;

    // What hosts show and tests read.
    IQuickFilterExtender* QuickFilter() const noexcept { return m_oQuickFilterExt.get(); }
    IFilterBandExtender* PricesBand() const noexcept { return m_oPricesExt.get(); }
    IFilterBandExtender* StoreBand() const noexcept { return m_oStoreExt.get(); }
    IFilterBandExtender* DiscountsBand() const noexcept { return m_oDiscountsExt.get(); }
    ICacheDefExtender* CacheDef() const noexcept { return m_oCacheDef.get(); }
    IFieldExtender* PreviewNote() const noexcept { return m_oNoteExt.get(); }
    // The selection state in use.
    const cItemsSelection& Selection() const noexcept { return m_oSel; }
    // The preview pane's markup and subtitle of the current row.
    std::string PreviewText();
    std::string PreviewSubtitle();
    // The 7 quick-find state values after the last search: the measure
    // (braced GUID), quantity and lot of the item found, and its ID.
    const cQuickFindState& QuickFindState() const noexcept;

protected:
    void pvInitList() override;
    void pvWriteFetchRequest(pelta::PropertyBag& Request) override;
    bool pvReadFetchResponse(pelta::PropertyBag& Response) override;
    void pvBindList() override;
    bool pvExecute(int32_t CommandID) override;
    void pvDetailDeleted() override;

private:
    friend class cItemsQuickFind;

    // ---- ctxItems.cpp: initialisation, fetch, commands ----
    void pvInitFilters();
    void pvInitCache();
    void pvReinit(IClientSite* Site);
    void pvFillFilterLists();
    // Keeps the sets of a response in the cache; false on a refusal.
    bool pvStoreSets(pelta::PropertyBag& Response);
    // Fetches the per-item sets that are missing, a call per group.
    bool pvFetchPerItemSets();
    // Drops cached sets and the indexes derived from them.
    void pvDropPrices();
    void pvDropComputedPrices();
    void pvDropStore();
    void pvDropDiscounts();
    void pvDropAll();
    void pvRefresh(bool Full);
    std::vector<std::string> pvSelectedIDs(bool OnlyInactive = false);
    std::string pvSelectedIDsText(bool OnlyInactive = false);
    // Calls an operation with the request; false when it failed or was refused.
    bool pvCallWrite(const std::string& Operation, pelta::PropertyBag& Request);
    void pvDeleteInactiveItems();
    void pvLinkSimilar();
    void pvBomPrices();
    void pvCostCenters();
    void pvDmaDetails(bool Current);
    void pvItemCard();
    void pvChooseSupplier();
    void pvUpdateCommands();

    // ---- events ----
    void m_oGridExt_FetchData(const pelta::Variant& Bookmark, const std::string& Column,
                              pelta::Variant& Value);
    void m_oGridExt_RowFormat(RowFormatArgs& Args);
    void m_oGridExt_ScannerReceive(const std::string& Code);
    void m_oQuickFilterExt_FilterClause(int32_t FilterID, const std::string& Text,
                                        std::string& Clause, bool& Handled);
    void m_oBand_Change(int32_t FilterID, const pelta::Variant& Value);
    void m_oBand_Click(int32_t FilterID);
    void m_oNoteExt_BeforeNavigate(const std::string& Url, bool& Cancel);

    // ---- ctxItemsPrices.cpp: the computed values of one row ----
    // The pricing over the cached sets, made again when they were dropped.
    cItemsPricing& pvPricing();
    const cItemRow& pvRow(const pelta::Variant& Bookmark);

    // ---- ctxItemsSelector.cpp ----
    RecordsetRef pvSelectionShape();
    RecordsetRef pvBuildSelection(const std::vector<pelta::Variant>& Bookmarks);

    pelta::Ref<IQuickFilterExtender> m_oQuickFilterExt;
    pelta::Ref<IFilterBandExtender> m_oPricesExt;
    pelta::Ref<IFilterBandExtender> m_oStoreExt;
    pelta::Ref<IFilterBandExtender> m_oDiscountsExt;
    pelta::Ref<ICacheDefExtender> m_oCacheDef;
    pelta::Ref<IFieldExtender> m_oNoteExt;
    pelta::Ref<ISplitterExtender> m_oSplitterExt;

    cItemsSelection m_oSel;
    bool m_bFullRefresh = true;
    bool m_bMediaChanged = false;
    std::string m_sMediaType, m_sMediaValue, m_sDimension, m_sDimValue;
    std::vector<std::string> m_vDimColumns;
    int32_t m_lPreviewTab = 0;

    std::unique_ptr<cItemsPricing> m_oPricing;
    RecordsetRef m_rsReader;  // reads list rows by bookmark; made again per list
    pelta::Recordset& pvReader();
    pelta::Variant m_vLastBookmark;  // the row m_oLastRow was computed for
    cItemRow m_oLastRow;
    std::unique_ptr<cItemsQuickFind> m_oQuickFind;
    cQuickFindState m_oQuickFindState;
    pelta::Ref<pelta::PropertyBag> m_oBag;  // "rs": the empty selection record
    // The kept selection of ShowSelect and the position of GetNextItem.
    RecordsetRef m_rsSelection;
    RecordsetRef m_rsSelectionShape;
};

}  // namespace PeltaNom15
