// The prices, availability and discounts the items list computes on the
// client from the extra result sets of "GetNomItems", and the in-memory
// indexes derived from those sets. Everything is exact decimal arithmetic;
// a missing or zero measure ratio or currency rate gives "N/A", never a
// division by zero.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

#include "library/contracts/Extenders.h"
#include "platform/automation/decimal.h"

namespace PeltaNom15 {

// Names and slots of the cached sets and derived indexes.
namespace itemsets {
inline constexpr const char* List = "List";
inline constexpr const char* MeasureRatios = "MeasureRatios";
inline constexpr const char* PriceList = "PriceList";
inline constexpr const char* StoreSaldo = "StoreSaldo";
inline constexpr const char* DiscountItems = "DiscountItems";
inline constexpr const char* CurrencyRatios = "CurrencyRatios";
inline constexpr const char* ItemsCurrencyMeasure = "m_cItemsCurrencyMeasure";
inline constexpr const char* PriceListBmks = "m_cPriceListBmks";
inline constexpr const char* PriceAdditional = "m_cPriceAdditional";
inline constexpr const char* MeasureRatiosBmks = "m_cMeasureRatiosBmks";
inline constexpr const char* ItemsPrices = "m_cItemsPrices";
inline constexpr const char* StoreSaldoBmks = "m_cStoreSaldoBmks";
inline constexpr const char* Discounts = "m_cDiscounts";
}  // namespace itemsets

// What the list shows prices, availability and discounts for.
struct cItemsSelection {
    std::string PriceListType;  // empty: the default type
    std::string Currency;       // empty: each item's own currency
    std::string Measure;        // empty: each item's base measure
    std::string Supplier;       // owner of the supplier price list
    std::string DiscountSchema;
    std::string Store;  // empty: every store
    // The type the service answered prices of (the default one when none
    // was chosen).
    std::string PriceListInUse;
};

// The quick find's findings for the item it identified.
struct cQuickFindState {
    std::string ItemID;   // the item the values below belong to
    std::string Measure;  // "{...}" of the code found, or empty
    std::optional<pelta::Decimal> Quantity;
    std::string Lot;
    std::string Third;
};

// A price in a price-list type, currency and measure.
struct cItemPrice {
    bool Available = false;  // false: "N/A"
    pelta::Decimal Price;
    pelta::Decimal PriceWithVat;
    std::string CurrencyID, CurrencyCode, MeasureID, MeasureCode;
    std::optional<pelta::Decimal> Rate;  // the currency's rate per unit
    bool IsPromo = false;
    std::string PromoType;
};

// Store quantities of an item, in the measure they are shown in.
struct cItemStock {
    bool Found = false;
    bool OtherMeasure = false;  // shown in a measure other than the base one
    bool RatioMissing = false;  // that measure has no ratio: "N/A"
    pelta::Decimal Quantity, Reserved, SecMeasure, TotalSum;
    std::optional<pelta::Decimal> MinQuantity;
    std::string MeasureID;
};

// Every computed value of one list row.
struct cItemRow {
    std::string ID;
    cItemPrice Price;
    cItemStock Stock;
    std::optional<pelta::Decimal> Discount;
    std::string AdditionalPrices;
};

// "#,##0.00######" style: thousands separated by ",", at least `MinDecimals`
// and at most `MaxDecimals` decimals (rounded half away from zero).
std::string FormatNumber(const pelta::Decimal& Value, int MinDecimals, int MaxDecimals);
// A stored code list (U+007F before every entry and after the last) as its
// entries.
std::vector<std::string> SplitCodeList(const std::string& List);
// The stored list as shown: entries joined by "; ".
std::string ShowCodeList(const std::string& List);

// The computations over the cached sets. The derived indexes are kept in the
// cache under their names, so that dropping a set and its indexes by name
// is all it takes to compute afresh.
class cItemsPricing {
public:
    cItemsPricing(ICacheDefExtender* Cache, const cItemsSelection& Selection);

    // The computed values of the list row at `Bookmark` (of the "List" set).
    cItemRow Row(const pelta::Variant& Bookmark);
    // The price of an item by its ID, default currency and base measure.
    // `Measure` other than empty overrides the measure of the selection (and
    // the result is not remembered).
    cItemPrice Price(const std::string& ItemID, const std::string& DefCurrency,
                     const std::string& BaseMeasure, const pelta::Decimal& Vat,
                     const std::string& Measure = {});
    cItemStock Stock(const std::string& ItemID, const std::string& BaseMeasure,
                     const std::string& Measure = {});
    std::optional<pelta::Decimal> Discount(const std::string& ItemID);
    // The ratio of `Measure` to the item's base measure (1 for the base one).
    std::optional<pelta::Decimal> MeasureRatio(const std::string& ItemID,
                                               const std::string& BaseMeasure,
                                               const std::string& Measure);
    // Rate per unit of a currency ("Rate" / "Units"); none when missing or zero.
    std::optional<pelta::Decimal> CurrencyRate(const std::string& Currency);
    std::string AdditionalPrices(const std::string& ItemID, const cItemPrice& Shown);
    // The 1-based positions in `Set` of the rows whose `Itm_ID` is `ItemID`
    // (the service orders every per-item set by item).
    std::vector<int64_t> ItemRows(const char* Set, const char* Index, const std::string& ItemID);
    // The code of a currency or measure from its reference set.
    std::string CodeOf(const char* Set, const std::string& ID);
    // A cached set standing on a position, through the reader of its index.
    pelta::Recordset* SetAt(const char* Set, const char* Index, int64_t Position);

private:
    ICacheDefExtender* m_oCache;
    const cItemsSelection& m_oSel;
};

}  // namespace PeltaNom15
