// The items list as the suite's item selector: the selection record, the
// walk over it, the quick find and the item information.
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/items/ctxItems.h"
#include "library/items/ctxItemsQuickFind.h"
#include "platform/automation/error.h"
#include "platform/data/propertybag.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

using pelta::Decimal;
using pelta::FieldType;

namespace {

constexpr const char* kObject = "ctxItems";
constexpr uint32_t kLotLength = 50;

struct AddedField {
    const char* name;
    FieldType type;
    uint8_t precision = 0;
    uint8_t scale = 0;
    uint32_t size = 0;
};

// The fields a selection record adds to those of the list row.
const AddedField kAdded[] = {
    {"IsVat", FieldType::Boolean},
    {"BasePrice", FieldType::Decimal, 19, 8},
    {"BasePriceWithVat", FieldType::Decimal, 20, 8},
    {"PriceMeasure_ID", FieldType::Guid},
    {"PriceMeasureCode", FieldType::Text, 0, 0, 50},
    {"IsPromo", FieldType::Boolean},
    {"PromoPlType_ID", FieldType::Guid},
    {"Currency_ID", FieldType::Guid},
    {"CurrencyCode", FieldType::Text, 0, 0, 50},
    {"Rate", FieldType::Decimal, 19, 8},
    {"StoreSaldo", FieldType::Decimal, 19, 8},
    {"StoreSaldoSecMeasure", FieldType::Decimal, 19, 8},
    {"StoreReserved", FieldType::Decimal, 19, 8},
    {"Discount", FieldType::Decimal, 19, 8},
    {"MinStoreSaldo", FieldType::Decimal, 19, 8},
    {"SaldoCgStore_ID", FieldType::Guid},
    {"SaldoCurrency_ID", FieldType::Guid},
    {"SaldoMeasure_ID", FieldType::Guid},
    {"QuickFindQuantity", FieldType::Decimal, 19, 8},
    {"QuickFindLot", FieldType::Text, 0, 0, kLotLength},
    // A value of any kind the caller keeps with the row; held as text.
    {"Tag", FieldType::LongText},
};

void SetIf(pelta::Recordset& rs, const char* field, const pelta::Variant& value) {
    if (value.isEmpty() || (value.isString() && value.str().empty())) return;
    rs.setValue(field, value);
}

// The first `n` characters of a UTF-8 text.
std::string CutChars(const std::string& s, uint32_t n) {
    uint32_t chars = 0;
    for (size_t i = 0; i < s.size(); ++i) {
        if ((static_cast<uint8_t>(s[i]) & 0xC0) != 0x80 && chars++ == n) return s.substr(0, i);
    }
    return s;
}

}  // namespace

// ---- the selection record --------------------------------------------------------------

RecordsetRef ctxItems::pvSelectionShape() {
    if (m_rsSelectionShape && m_rsList &&
        m_rsSelectionShape->fieldCount() >= m_rsList->fieldCount())
        return m_rsSelectionShape;
    auto shape = pelta::makeRef<pelta::Recordset>();
    if (m_rsList)
        for (size_t i = 0; i < m_rsList->fieldCount(); ++i) {
            pelta::FieldDef f = m_rsList->fieldDef(i);
            // Copied from the list, the record's own fields are typed as below.
            bool added = false;
            for (const auto& a : kAdded)
                if (f.name == a.name) added = true;
            if (!added) shape->appendField(std::move(f));
        }
    for (const auto& a : kAdded) {
        pelta::FieldDef f;
        f.name = a.name;
        f.type = a.type;
        f.precision = a.precision;
        f.scale = a.scale;
        f.definedSize = a.size;
        shape->appendField(std::move(f));
    }
    shape->open();
    m_rsSelectionShape = shape;
    m_oBag->writeProperty("rs", pelta::Variant(pelta::ObjectRef(shape)));
    return shape;
}

RecordsetRef ctxItems::pvBuildSelection(const std::vector<pelta::Variant>& Bookmarks) {
    auto shape = pvSelectionShape();
    auto rs = pelta::makeRef<pelta::Recordset>();
    for (size_t i = 0; i < shape->fieldCount(); ++i)
        rs->appendField(shape->fieldDef(i));
    rs->open();
    if (!m_rsList) return rs;
    const bool merge = m_oSite && C2Bool(m_oSite->Parameter("MergeItmCodeName"));
    auto* row = &pvReader();
    for (const auto& bookmark : Bookmarks) {
        row->setBookmark(bookmark);
        rs->addNew();
        for (size_t i = 0; i < row->fieldCount(); ++i) {
            const std::string& name = row->fieldDef(i).name;
            if (rs->fieldIndex(name) >= 0) rs->setValue(name, row->value(i));
        }
        const std::string id = C2Str(row->value("ID"));
        if (merge)
            rs->setValue("Name", pelta::Variant("[" + C2Str(row->value("Code")) + "] " +
                                                C2Str(row->value("Name"))));
        // The measure and the quantity found by the quick find belong to its
        // item only.
        const bool found = !m_oQuickFindState.ItemID.empty() && m_oQuickFindState.ItemID == id;
        const std::string measure =
            found && m_oQuickFindState.Measure.size() == 38 ? m_oQuickFindState.Measure : "";
        const std::string base = C2Str(row->value("Measure_ID"));
        const Decimal vat = row->value("Vat").isNull() ? Decimal() : row->value("Vat").toDecimal();
        const cItemPrice p =
            pvPricing().Price(id, C2Str(row->value("DefCurrency_ID")), base, vat, measure);
        const cItemStock s = pvPricing().Stock(id, base, measure);
        if (p.Available) {
            rs->setValue("BasePrice", pelta::Variant(p.Price));
            rs->setValue("BasePriceWithVat", pelta::Variant(p.PriceWithVat));
        }
        SetIf(*rs, "PriceMeasure_ID", pelta::Variant(p.MeasureID));
        SetIf(*rs, "PriceMeasureCode", pelta::Variant(p.MeasureCode));
        rs->setValue("IsPromo", pelta::Variant(p.IsPromo));
        SetIf(*rs, "PromoPlType_ID", pelta::Variant(p.PromoType));
        SetIf(*rs, "Currency_ID", pelta::Variant(p.CurrencyID));
        SetIf(*rs, "CurrencyCode", pelta::Variant(p.CurrencyCode));
        if (p.Rate) rs->setValue("Rate", pelta::Variant(*p.Rate));
        if (s.Found && !s.RatioMissing) {
            rs->setValue("StoreSaldo", pelta::Variant(s.Quantity));
            rs->setValue("StoreSaldoSecMeasure", pelta::Variant(s.SecMeasure));
            rs->setValue("StoreReserved", pelta::Variant(s.Reserved));
            if (s.MinQuantity) rs->setValue("MinStoreSaldo", pelta::Variant(*s.MinQuantity));
        }
        SetIf(*rs, "SaldoCgStore_ID", pelta::Variant(m_oSel.Store));
        SetIf(*rs, "SaldoCurrency_ID", pelta::Variant(p.CurrencyID));
        SetIf(*rs, "SaldoMeasure_ID", pelta::Variant(s.Found ? s.MeasureID : base));
        if (auto d = pvPricing().Discount(id)) rs->setValue("Discount", pelta::Variant(*d));
        if (found) {
            if (m_oQuickFindState.Quantity)
                rs->setValue("QuickFindQuantity", pelta::Variant(*m_oQuickFindState.Quantity));
            SetIf(*rs, "QuickFindLot", pelta::Variant(CutChars(m_oQuickFindState.Lot, kLotLength)));
        }
        rs->update();
    }
    rs->updateBatch();
    if (rs->recordCount() > 0) rs->moveFirst();
    return rs;
}

// ---- IZonSelector -------------------------------------------------------------------------

bool ctxItems::ShowSelect(pelta::Variant& CurrentValue, pelta::Variant& SearchText,
                          pelta::Variant& Result) {
    try {
        auto marked = m_oGridExt->SelectedBookmarks();
        if (marked.empty() && m_oGridExt->HasCurrentRow())
            marked.push_back(m_oGridExt->CurrentBookmark());
        m_rsSelection = pvBuildSelection(marked);
        Result = pelta::Variant(pelta::ObjectRef(m_rsSelection->clone()));
        return m_rsSelection->recordCount() > 0;
    } catch (...) {
        ShowError("IZonSelector_ShowSelect", kObject, m_oDef.Caption);
        return false;
    }
}

bool ctxItems::GetNextItem(pelta::Variant& ID, pelta::Variant& Name, pelta::Variant& Item) {
    try {
        if (!m_rsSelection || m_rsSelection->eof() || m_rsSelection->recordCount() == 0)
            return false;
        ID = m_rsSelection->value("ID");
        Name = m_rsSelection->value("Name");
        Item = pelta::Variant(pelta::ObjectRef(m_rsSelection));
        m_oGridExt->MoveToRow("ID = '" + SqlQuote(C2Str(ID)) + "'");
        m_rsSelection->moveNext();
        return true;
    } catch (...) {
        ShowError("IZonSelector_GetNextItem", kObject, m_oDef.Caption);
        return false;
    }
}

bool ctxItems::QuickFind(const std::string& Text, pelta::Variant& Result) {
    try {
        pelta::Variant found;
        Result = pelta::Variant();
        if (!m_oQuickFind->Find(m_rsList, Text, found, m_oQuickFindState)) return false;
        if (!m_oGridExt->SetCurrentBookmark(found) && !(m_oGridExt->CurrentBookmark() == found)) {
            m_oQuickFindState = {};
            return false;  // the item is not among the rows shown
        }
        Result = pelta::Variant(pelta::ObjectRef(pvBuildSelection({found})));
        return true;
    } catch (...) {
        m_oQuickFindState = {};
        ShowError("IZonSelector_QuickFind", kObject, m_oDef.Caption);
        return false;
    }
}

bool ctxItems::Reset() {
    m_rsSelection.reset();
    if (m_oGridExt) m_oGridExt->SetSelectedBookmarks({});
    return true;
}

bool ctxItems::GetItemInfo(const std::string& ID, pelta::Ref<pelta::Recordset>& Prices,
                           pelta::Ref<pelta::Recordset>& MeasureRatios) {
    try {
        Prices.reset();
        MeasureRatios.reset();
        if (!m_rsList || !IsGuid(ID)) return false;
        auto probe = m_rsList->clone();
        if (probe->recordCount() == 0 || !probe->find("ID = '" + SqlQuote(ID) + "'")) return false;
        const std::string criterion = "Itm_ID = '" + SqlQuote(ID) + "'";
        auto filtered = [&](const char* name) -> RecordsetRef {
            auto set = pelta::Ref<pelta::Recordset>(
                pelta::query<pelta::Recordset>(m_oCacheDef->Item(name).object()));
            if (!set) return {};
            auto rs = set->clone();
            rs->setFilter(criterion);
            return rs;
        };
        Prices = filtered(itemsets::PriceList);
        MeasureRatios = filtered(itemsets::MeasureRatios);
        return true;
    } catch (...) {
        RaiseError("IZonItemsSelector_GetItemInfo", kObject);
        return false;
    }
}

}  // namespace PeltaNom15
