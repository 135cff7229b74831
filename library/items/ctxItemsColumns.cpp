// The computed columns of the items list, their formatting, the preview pane
// and the scanner.
#include "library/contracts/Constants.h"
#include "library/frame/mdClassFactory.h"
#include "library/frame/mdErrorHandling.h"
#include "library/frame/mdGlobals.h"
#include "library/items/ctxItems.h"
#include "library/items/ctxItemsQuickFind.h"
#include "platform/automation/error.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

using pelta::Decimal;

namespace {

constexpr const char* kNA = "N/A";

pelta::Variant Dec(const Decimal& d) {
    return pelta::Variant(d);
}

pelta::Variant Opt(const std::optional<Decimal>& d) {
    return d ? pelta::Variant(*d) : pelta::Variant::null();
}

std::string CurrencyShown(const std::string& Code) {
    return Code == "BGN" ? "лв." : Code;
}

}  // namespace

pelta::Recordset& ctxItems::pvReader() {
    if (!m_rsReader) m_rsReader = m_rsList->clone();
    return *m_rsReader;
}

cItemsPricing& ctxItems::pvPricing() {
    return *m_oPricing;
}

const cItemRow& ctxItems::pvRow(const pelta::Variant& Bookmark) {
    if (m_vLastBookmark.isEmpty() || !(m_vLastBookmark == Bookmark)) {
        m_oLastRow = pvPricing().Row(Bookmark);
        m_vLastBookmark = Bookmark;
    }
    return m_oLastRow;
}

void ctxItems::m_oGridExt_FetchData(const pelta::Variant& Bookmark, const std::string& Column,
                                    pelta::Variant& Value) {
    Value = pelta::Variant();
    if (!m_rsList) return;
    if (Column == "BarCodes" || Column == "SupplCodes") {
        auto& rs = pvReader();
        rs.setBookmark(Bookmark);
        Value = pelta::Variant(ShowCodeList(C2Str(rs.value(Column))));
        return;
    }
    const cItemRow& r = pvRow(Bookmark);
    const cItemPrice& p = r.Price;
    const cItemStock& s = r.Stock;
    auto price = [&](const Decimal& d) { return p.Available ? Dec(d) : pelta::Variant(kNA); };
    auto stock = [&](const Decimal& d) {
        if (!s.Found) return pelta::Variant::null();
        return s.RatioMissing ? pelta::Variant(kNA) : Dec(d);
    };
    const Decimal discount = r.Discount.value_or(Decimal());
    const Decimal kept = Decimal(1) - discount / Decimal(100);
    if (Column == "BasePrice") {
        Value = price(p.Price);
    } else if (Column == "BasePriceWithVat") {
        Value = price(p.PriceWithVat);
    } else if (Column == "MeasureCode") {
        Value = pelta::Variant(p.MeasureCode);
    } else if (Column == "CurrencyCode") {
        Value = pelta::Variant(p.CurrencyCode);
    } else if (Column == "Rate") {
        Value = p.Rate ? Dec(*p.Rate) : pelta::Variant(kNA);
    } else if (Column == "Measure_ID") {
        Value = pelta::Variant(p.MeasureID);
    } else if (Column == "Currency_ID") {
        Value = pelta::Variant(p.CurrencyID);
    } else if (Column == "IsPromo") {
        Value = pelta::Variant(p.IsPromo);
    } else if (Column == "PromoPlType_ID") {
        Value = p.PromoType.empty() ? pelta::Variant::null() : pelta::Variant(p.PromoType);
    } else if (Column == "AdditionalPrices") {
        Value = pelta::Variant(r.AdditionalPrices);
    } else if (Column == "Discount") {
        Value = Opt(r.Discount);
    } else if (Column == "PriceWithDiscount") {
        Value = price((p.Price * kept).round(8));
    } else if (Column == "PriceWithVatDiscount") {
        // The price without VAT, less the discount, plus the item's VAT.
        auto& rs = pvReader();
        rs.setBookmark(Bookmark);
        const Decimal vat = rs.value("Vat").isNull() ? Decimal() : rs.value("Vat").toDecimal();
        Value = price((p.Price * kept * (Decimal(1) + vat / Decimal(100))).round(8));
    } else if (Column == "StoreSaldo") {
        Value = stock(s.Quantity);
    } else if (Column == "StoreReserved") {
        Value = stock(s.Reserved);
    } else if (Column == "StoreAvailable") {
        Value = stock(s.Quantity - s.Reserved);
    } else if (Column == "StoreSaldoSecMeasure") {
        Value = s.Found ? Dec(s.SecMeasure) : pelta::Variant::null();
    } else if (Column == "MinStoreSaldo") {
        Value = s.Found ? Opt(s.MinQuantity) : pelta::Variant::null();
    } else if (Column == "StoreAvgPrice") {
        if (s.Found)
            Value =
                s.Quantity.isZero() ? pelta::Variant(kNA) : Dec((s.TotalSum / s.Quantity).round(8));
    }
}

void ctxItems::m_oGridExt_RowFormat(RowFormatArgs& Args) {
    if (!m_rsList || Args.Bookmark.isEmpty()) return;
    const cItemRow& r = pvRow(Args.Bookmark);
    if (!r.Price.Available)
        for (const char* c :
             {"BasePrice", "BasePriceWithVat", "PriceWithDiscount", "PriceWithVatDiscount"})
            Args.CellStyles.emplace_back(c, "PriceNA");
    const cItemStock& s = r.Stock;
    if (s.Found && s.OtherMeasure)
        for (const char* c : {"StoreSaldo", "StoreAvailable", "StoreReserved", "MinStoreSaldo"})
            Args.CellStyles.emplace_back(c, "MeasureRatio");
    // Only where a minimum exists can the stock be below it.
    if (s.Found && s.MinQuantity && !s.RatioMissing && s.Quantity - s.Reserved < *s.MinQuantity)
        Args.CellStyles.emplace_back("StoreAvailable", "MinQuantity");
}

void ctxItems::m_oGridExt_ScannerReceive(const std::string& Code) {
    const std::string text = [&] {
        auto host = HostApplication();
        const bool codeFirst = host && C2Bool(host->Option("SearchByCodeFirst"));
        return codeFirst ? Code : "//" + Code;
    }();
    pelta::Variant result;
    QuickFind(text, result);
}

void ctxItems::m_oNoteExt_BeforeNavigate(const std::string& Url, bool& Cancel) {
    constexpr std::string_view kTab = "__tab__";
    if (Url.rfind(kTab, 0) != 0) return;
    Cancel = true;
    const int32_t tab = C2Lng(pelta::Variant(Url.substr(kTab.size())));
    if (tab < 0 || tab > 2) return;
    m_lPreviewTab = tab;
    m_oForm->SetControlValue("nvPreview", pelta::Variant(PreviewText()));
}

std::string ctxItems::PreviewText() {
    static const char* const kTabs[] = {"Общи", "Продажби", "Покупки"};
    std::string text;
    for (int32_t i = 0; i < 3; ++i) {
        if (i == m_lPreviewTab)
            text += std::string("[b]  ") + kTabs[i] + "  [/b]|";
        else
            text += "  [url=__tab__" + std::to_string(i) + "]" + kTabs[i] + "[/url]  |";
    }
    if (!m_oGridExt || !m_oGridExt->HasCurrentRow()) return text;
    const std::string name = C2Str(m_oGridExt->CurrentValue("Name"));
    if (m_lPreviewTab == 0) {
        text += Printf("[b][size=12]%1[/size][/b]", name);
        const std::string more = C2Str(m_oGridExt->CurrentValue("AdditionalPrices"));
        if (!more.empty()) text += "\n" + more;
    } else if (m_lPreviewTab == 1) {
        // Sales have no source in the catalogue: their count and total are 0.
        static const char* kRow =
            "[row=,%1;white,%1,,%1;white,%2,white][color=%3][size=%4]%5[/size][/color][col]"
            "[color=black]%6[/color][/row]";
        text += Printf("[b][size=12]%1[/size][/b]", name);
        text += Printf("[table=2200,%1;70,170]", 2);
        text += Printf(kRow, 18, "white", "gray", 9, "Брой продажби", "0");
        text += Printf(kRow, 18, "white", "gray", 9, "Общо продажби",
                       Printf("%1 лв.", FormatNumber(Decimal(), 2, 2)));
        text += "[/table]";
    }
    return text;
}

std::string ctxItems::PreviewSubtitle() {
    if (!m_oGridExt || !m_oGridExt->HasCurrentRow()) return {};
    const pelta::Variant bookmark = m_oGridExt->CurrentBookmark();
    const cItemRow& r = pvRow(bookmark);
    std::vector<std::string> lines;
    std::string quantity;
    if (m_oQuickFindState.Quantity && m_oQuickFindState.ItemID == r.ID) {
        quantity = FormatNumber(*m_oQuickFindState.Quantity, 0, 8);
        lines.push_back(Printf("%1 %2", quantity, r.Price.MeasureCode));
    }
    if (r.Price.Available) {
        std::string line =
            Printf("%1 %3 (%2 без ДДС)", FormatNumber(r.Price.PriceWithVat, 2, 8),
                   FormatNumber(r.Price.Price, 2, 8), CurrencyShown(r.Price.CurrencyCode));
        lines.push_back(quantity.empty() ? line : quantity + " x " + line);
    }
    std::string note = C2Str(m_oGridExt->CurrentValue("Note"));
    while (!note.empty() && (note.back() == ' ' || note.back() == '\n' || note.back() == '\r'))
        note.pop_back();
    while (!note.empty() && (note.front() == ' ' || note.front() == '\n'))
        note.erase(0, 1);
    if (!note.empty()) lines.push_back(note);
    std::string out;
    for (const auto& l : lines)
        out += (out.empty() ? "" : "\n") + l;
    return out;
}

}  // namespace PeltaNom15
