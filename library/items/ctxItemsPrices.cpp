#include "library/items/ctxItemsPrices.h"

#include <algorithm>

#include "library/frame/mdGlobals.h"
#include "platform/automation/error.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

using pelta::Decimal;

namespace {

constexpr char kSep = '\x7F';
constexpr int kPriceScale = 8;

// A memo of values by key, kept in the cache as a derived index.
template <class K, class V>
class cMemo final : public pelta::Object {
public:
    std::unordered_map<K, V> Map;
};

// Positions of the rows of a set ordered by "Itm_ID", found by binary
// search and remembered per item.
class cPositions final : public pelta::Object {
public:
    explicit cPositions(const RecordsetRef& Set)
        : m_rs(Set->clone()), m_lField(Set->fieldIndex("Itm_ID")) {}

    const std::vector<int64_t>& Rows(const std::string& Item) {
        auto it = m_oMemo.find(Item);
        if (it != m_oMemo.end()) return it->second;
        std::vector<int64_t> rows;
        const int64_t n = m_lField < 0 ? 0 : m_rs->recordCount();
        int64_t lo = 1, hi = n + 1;  // first position whose key is not below Item
        while (lo < hi) {
            const int64_t mid = lo + (hi - lo) / 2;
            if (Key(mid) < Item)
                lo = mid + 1;
            else
                hi = mid;
        }
        for (int64_t p = lo; p <= n && Key(p) == Item; ++p)
            rows.push_back(p);
        return m_oMemo.emplace(Item, std::move(rows)).first->second;
    }

    // The set standing on a position (the index's own reader).
    pelta::Recordset& At(int64_t Position) {
        m_rs->setAbsolutePosition(Position);
        return *m_rs;
    }

private:
    std::string Key(int64_t Position) {
        m_rs->setAbsolutePosition(Position);
        return C2Str(m_rs->value(static_cast<size_t>(m_lField)));
    }

    RecordsetRef m_rs;
    int m_lField;
    std::unordered_map<std::string, std::vector<int64_t>> m_oMemo;
};

// The discount of each item, found in the discount set by position.
class cDiscountIndex final : public pelta::Object {
public:
    explicit cDiscountIndex(const RecordsetRef& Set) : Positions(Set), Reader(Set->clone()) {}
    cPositions Positions;
    RecordsetRef Reader;
    std::unordered_map<std::string, std::optional<Decimal>> Memo;
};

// What the list row of an item gives the computations, by bookmark, with a
// reader of the list that stays for as long as the list.
struct cItemKeys {
    std::string ID, DefCurrency, Measure;
    Decimal Vat;
};

class cListKeys final : public pelta::Object {
public:
    explicit cListKeys(const RecordsetRef& List) : Reader(List->clone()) {}
    RecordsetRef Reader;
    std::unordered_map<int64_t, cItemKeys> Map;
};

template <class T, class... A>
T& Derived(ICacheDefExtender* Cache, const char* Name, A&&... Args) {
    pelta::Variant v = Cache->Item(Name);
    if (auto* t = dynamic_cast<T*>(v.object())) return *t;
    auto made = pelta::makeRef<T>(std::forward<A>(Args)...);
    Cache->SetItem(Name, pelta::Variant(pelta::ObjectRef(made)));
    return *made;  // the cache holds it
}

RecordsetRef CachedSet(ICacheDefExtender* Cache, const char* Name) {
    pelta::Variant v = Cache->Item(Name);
    return pelta::Ref<pelta::Recordset>(pelta::query<pelta::Recordset>(v.object()));
}

std::optional<Decimal> DecimalOf(const pelta::Variant& v) {
    if (v.isNull() || v.isEmpty()) return std::nullopt;
    try {
        return v.toDecimal();
    } catch (const pelta::Error&) {
        return std::nullopt;
    }
}

bool SameKey(const std::string& a, const std::string& b) {
    return a.size() == b.size() && std::equal(a.begin(), a.end(), b.begin(), [](char x, char y) {
               return std::toupper(static_cast<unsigned char>(x)) ==
                      std::toupper(static_cast<unsigned char>(y));
           });
}

}  // namespace

// ---- texts -----------------------------------------------------------------------------

std::string FormatNumber(const Decimal& Value, int MinDecimals, int MaxDecimals) {
    const Decimal r = Value.round(MaxDecimals);
    std::string plain = r.abs().toString();
    std::string whole = plain, frac;
    if (auto dot = plain.find('.'); dot != std::string::npos) {
        whole = plain.substr(0, dot);
        frac = plain.substr(dot + 1);
    }
    while (static_cast<int>(frac.size()) > MinDecimals && !frac.empty() && frac.back() == '0')
        frac.pop_back();
    while (static_cast<int>(frac.size()) < MinDecimals)
        frac.push_back('0');
    std::string grouped;
    for (size_t i = 0; i < whole.size(); ++i) {
        if (i > 0 && (whole.size() - i) % 3 == 0) grouped.push_back(',');
        grouped.push_back(whole[i]);
    }
    std::string out = (r.negative() && !r.isZero()) ? "-" : "";
    out += grouped;
    if (!frac.empty()) out += "." + frac;
    return out;
}

std::vector<std::string> SplitCodeList(const std::string& List) {
    std::vector<std::string> out;
    size_t start = 0;
    while (start < List.size()) {
        size_t sep = List.find(kSep, start);
        if (sep == std::string::npos) sep = List.size();
        if (sep > start) out.push_back(List.substr(start, sep - start));
        start = sep + 1;
    }
    return out;
}

std::string ShowCodeList(const std::string& List) {
    std::string out;
    for (const auto& e : SplitCodeList(List))
        out += (out.empty() ? "" : "; ") + e;
    return out;
}

// ---- pricing ---------------------------------------------------------------------------

cItemsPricing::cItemsPricing(ICacheDefExtender* Cache, const cItemsSelection& Selection)
    : m_oCache(Cache), m_oSel(Selection) {}

std::vector<int64_t> cItemsPricing::ItemRows(const char* Set, const char* Index,
                                             const std::string& ItemID) {
    auto set = CachedSet(m_oCache, Set);
    if (!set || ItemID.empty()) return {};
    return Derived<cPositions>(m_oCache, Index, set).Rows(ItemID);
}

std::string cItemsPricing::CodeOf(const char* Set, const std::string& ID) {
    auto rs = CachedSet(m_oCache, Set);
    if (!rs || ID.empty()) return {};
    auto c = rs->clone();
    if (c->recordCount() == 0 || !c->find("ID = '" + SqlQuote(ID) + "'")) return {};
    return C2Str(c->value("Code"));
}

pelta::Recordset* cItemsPricing::SetAt(const char* Set, const char* Index, int64_t Position) {
    auto set = CachedSet(m_oCache, Set);
    if (!set) return nullptr;
    return &Derived<cPositions>(m_oCache, Index, set).At(Position);
}

std::optional<Decimal> cItemsPricing::CurrencyRate(const std::string& Currency) {
    auto rates = CachedSet(m_oCache, itemsets::CurrencyRatios);
    if (!rates || Currency.empty()) return std::nullopt;
    auto rs = rates->clone();
    if (rs->recordCount() == 0 || !rs->find("Currency_ID = '" + SqlQuote(Currency) + "'"))
        return std::nullopt;
    auto rate = DecimalOf(rs->value("Rate"));
    Decimal units(1);
    if (rs->fieldIndex("Units") >= 0) {
        auto u = DecimalOf(rs->value("Units"));
        if (!u) return std::nullopt;
        units = *u;
    }
    if (!rate || rate->isZero() || units.isZero()) return std::nullopt;
    return *rate / units;
}

std::optional<Decimal> cItemsPricing::MeasureRatio(const std::string& ItemID,
                                                   const std::string& BaseMeasure,
                                                   const std::string& Measure) {
    if (Measure.empty() || SameKey(Measure, BaseMeasure)) return Decimal(1);
    for (int64_t p : ItemRows(itemsets::MeasureRatios, itemsets::MeasureRatiosBmks, ItemID)) {
        auto rs = SetAt(itemsets::MeasureRatios, itemsets::MeasureRatiosBmks, p);
        if (!SameKey(C2Str(rs->value("Measure_ID")), Measure)) continue;
        auto ratio = DecimalOf(rs->value("Ratio"));
        if (!ratio || ratio->isZero()) return std::nullopt;
        return ratio;
    }
    return std::nullopt;
}

cItemPrice cItemsPricing::Price(const std::string& ItemID, const std::string& DefCurrency,
                                const std::string& BaseMeasure, const Decimal& Vat,
                                const std::string& Measure) {
    auto& memo = Derived<cMemo<std::string, cItemPrice>>(m_oCache, itemsets::ItemsPrices);
    if (Measure.empty())
        if (auto it = memo.Map.find(ItemID); it != memo.Map.end()) return it->second;

    const std::string wantCur = m_oSel.Currency.empty() ? DefCurrency : m_oSel.Currency;
    const std::string& measure = Measure.empty() ? m_oSel.Measure : Measure;
    const std::string wantMeas = measure.empty() ? BaseMeasure : measure;
    cItemPrice out;
    out.CurrencyID = wantCur;
    out.MeasureID = wantMeas;
    out.Rate = CurrencyRate(wantCur);

    struct Candidate {
        int64_t position;
        std::string currency, measure;
    };
    std::vector<Candidate> rows;
    for (int64_t p : ItemRows(itemsets::PriceList, itemsets::PriceListBmks, ItemID)) {
        auto rs = SetAt(itemsets::PriceList, itemsets::PriceListBmks, p);
        rows.push_back({p, C2Str(rs->value("Currency_ID")), C2Str(rs->value("Measure_ID"))});
    }
    // The row in the wanted currency and measure; else the nearest one to
    // convert from: same currency, same measure, the item's own, any.
    const Candidate* source = nullptr;
    int best = 0;
    for (const auto& c : rows) {
        const bool cur = SameKey(c.currency, wantCur), meas = SameKey(c.measure, wantMeas);
        const int score = cur && meas                                                           ? 5
                          : cur                                                                 ? 4
                          : meas                                                                ? 3
                          : SameKey(c.currency, DefCurrency) && SameKey(c.measure, BaseMeasure) ? 2
                                                                                                : 1;
        if (score > best) best = score, source = &c;
    }
    if (source) {
        auto rs = SetAt(itemsets::PriceList, itemsets::PriceListBmks, source->position);
        auto price = DecimalOf(rs->value("BasePrice"));
        auto withVat = DecimalOf(rs->value("BasePriceWithVat"));
        bool ok = price.has_value();
        Decimal factor(1);
        if (ok && !SameKey(source->measure, wantMeas)) {
            // Per wanted measure: per source measure times their ratio.
            auto to = MeasureRatio(ItemID, BaseMeasure, wantMeas);
            auto from = MeasureRatio(ItemID, BaseMeasure, source->measure);
            ok = to && from;
            if (ok) factor = factor * *to / *from;
        }
        if (ok && !SameKey(source->currency, wantCur)) {
            // Through the national currency: both rates and their units.
            auto from = CurrencyRate(source->currency);
            ok = from && out.Rate;
            if (ok) factor = factor * *from / *out.Rate;
        }
        if (ok) {
            out.Available = true;
            out.Price = (*price * factor).round(kPriceScale);
            out.PriceWithVat =
                withVat ? (*withVat * factor).round(kPriceScale)
                        : (out.Price * (Decimal(1) + Vat / Decimal(100))).round(kPriceScale);
        }
    }
    out.MeasureCode = CodeOf("Measures", wantMeas);
    out.CurrencyCode = CodeOf("Currencies", wantCur);
    // A promotional type marks its prices.
    if (auto types = CachedSet(m_oCache, "PriceListType");
        types && !m_oSel.PriceListInUse.empty()) {
        auto t = types->clone();
        if (t->recordCount() > 0 && t->find("ID = '" + SqlQuote(m_oSel.PriceListInUse) + "'") &&
            C2Bool(t->value("IsPromo"))) {
            out.IsPromo = true;
            out.PromoType = m_oSel.PriceListInUse;
        }
    }
    if (Measure.empty()) memo.Map.emplace(ItemID, out);
    return out;
}

cItemStock cItemsPricing::Stock(const std::string& ItemID, const std::string& BaseMeasure,
                                const std::string& Measure) {
    const std::string& measure = Measure.empty() ? m_oSel.Measure : Measure;
    cItemStock out;
    auto rows = ItemRows(itemsets::StoreSaldo, itemsets::StoreSaldoBmks, ItemID);
    if (rows.empty()) return out;
    auto rs = SetAt(itemsets::StoreSaldo, itemsets::StoreSaldoBmks, rows.front());
    out.Found = true;
    out.Quantity = DecimalOf(rs->value("Quantity")).value_or(Decimal());
    out.Reserved = DecimalOf(rs->value("QuantityReserved")).value_or(Decimal());
    out.SecMeasure = DecimalOf(rs->value("QuantitySecMeasure")).value_or(Decimal());
    out.TotalSum = DecimalOf(rs->value("TotalSum")).value_or(Decimal());
    out.MinQuantity = DecimalOf(rs->value("MinQuantity"));
    out.MeasureID = BaseMeasure;
    if (!measure.empty() && !SameKey(measure, BaseMeasure)) {
        out.OtherMeasure = true;
        out.MeasureID = measure;
        auto ratio = MeasureRatio(ItemID, BaseMeasure, measure);
        if (!ratio) {
            out.RatioMissing = true;
        } else {
            out.Quantity = (out.Quantity / *ratio).round(kPriceScale);
            out.Reserved = (out.Reserved / *ratio).round(kPriceScale);
            if (out.MinQuantity) out.MinQuantity = (*out.MinQuantity / *ratio).round(kPriceScale);
        }
    }
    return out;
}

std::optional<Decimal> cItemsPricing::Discount(const std::string& ItemID) {
    auto set = CachedSet(m_oCache, itemsets::DiscountItems);
    if (!set) return std::nullopt;
    auto& index = Derived<cDiscountIndex>(m_oCache, itemsets::Discounts, set);
    if (auto it = index.Memo.find(ItemID); it != index.Memo.end()) return it->second;
    std::optional<Decimal> d;
    const auto& rows = index.Positions.Rows(ItemID);
    if (!rows.empty()) {
        index.Reader->setAbsolutePosition(rows.front());
        d = DecimalOf(index.Reader->value("Discount"));
    }
    index.Memo.emplace(ItemID, d);
    return d;
}

std::string cItemsPricing::AdditionalPrices(const std::string& ItemID, const cItemPrice& Shown) {
    auto& memo = Derived<cMemo<std::string, std::string>>(m_oCache, itemsets::PriceAdditional);
    if (auto it = memo.Map.find(ItemID); it != memo.Map.end()) return it->second;
    // Measures in the order of their first price row; within a measure the
    // currencies, each price with VAT and its currency code.
    std::vector<std::pair<std::string, std::string>> measures;  // code, text
    for (int64_t p : ItemRows(itemsets::PriceList, itemsets::PriceListBmks, ItemID)) {
        auto rs = SetAt(itemsets::PriceList, itemsets::PriceListBmks, p);
        const std::string cur = C2Str(rs->value("Currency_ID"));
        const std::string meas = C2Str(rs->value("Measure_ID"));
        if (Shown.Available && SameKey(cur, Shown.CurrencyID) && SameKey(meas, Shown.MeasureID))
            continue;
        auto price = DecimalOf(rs->value("BasePriceWithVat"));
        if (!price) continue;
        const std::string code = CodeOf("Measures", meas);
        const std::string entry = FormatNumber(*price, 2, 8) + " " + CodeOf("Currencies", cur);
        auto it = std::find_if(measures.begin(), measures.end(),
                               [&](const auto& m) { return m.first == code; });
        if (it == measures.end())
            measures.emplace_back(code, code + ": " + entry);
        else
            it->second += ", " + entry;
    }
    std::string text;
    for (const auto& m : measures)
        text += (text.empty() ? "" : "; ") + m.second;
    memo.Map.emplace(ItemID, text);
    return text;
}

cItemRow cItemsPricing::Row(const pelta::Variant& Bookmark) {
    auto list = CachedSet(m_oCache, itemsets::List);
    if (!list) return {};
    auto& keys = Derived<cListKeys>(m_oCache, itemsets::ItemsCurrencyMeasure, list);
    const int64_t mark = static_cast<int64_t>(Bookmark.toDouble());
    auto it = keys.Map.find(mark);
    if (it == keys.Map.end()) {
        auto& rs = keys.Reader;
        rs->setBookmark(Bookmark);
        cItemKeys k;
        k.ID = C2Str(rs->value("ID"));
        k.DefCurrency = C2Str(rs->value("DefCurrency_ID"));
        k.Measure = C2Str(rs->value("Measure_ID"));
        k.Vat = DecimalOf(rs->value("Vat")).value_or(Decimal());
        it = keys.Map.emplace(mark, std::move(k)).first;
    }
    const cItemKeys& k = it->second;
    cItemRow row;
    row.ID = k.ID;
    row.Price = Price(k.ID, k.DefCurrency, k.Measure, k.Vat);
    row.Stock = Stock(k.ID, k.Measure);
    row.Discount = Discount(k.ID);
    row.AdditionalPrices = AdditionalPrices(k.ID, row.Price);
    return row;
}

}  // namespace PeltaNom15
