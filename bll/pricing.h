// Prices the service forms itself: the rounding of formed prices, and the
// prices and totals of bills of materials. All in exact decimals.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "platform/automation/decimal.h"

namespace pelta::bll {

class Database;

// A rounding of formed prices (nom_roundtypes).
struct RoundType {
    int64_t modulo = 0;    // 0: no steps
    int64_t reminder = 0;  // where a step ends, in units of the last decimal
    int direction = 1;     // 1 up, 2 down, 3 to the nearest
    bool vatIncluded = false;
};

// Rounds a formed price: to 8 decimals; then, with steps, onto the nearest
// step of `modulo` units of the price scale's last decimal (1/-modulo of a
// unit when negative) plus `reminder` units, taken as `direction` says. With
// `vatIncluded` the steps apply to the price with `vatPercent` added, which
// is rounded to `scale` decimals and taken back without VAT.
Decimal roundFormedPrice(const Decimal& price, const RoundType& round, const Decimal& vatPercent,
                         int scale);

// The current price of one base-measure unit of an item turned into
// `measureId` (the base measure when empty): the standard price (RatePrice)
// when set and above zero, else the weighted average over the stores
// (their value over their quantity) while the stores hold some; nothing when
// neither is known or the measure has no facet for the item.
std::optional<Decimal> componentPrice(Database& db, const std::string& itemId,
                                      const std::string& measureId);

// Prices every row of every bill of materials of `itemId` anew from its
// component's current price (a row whose component has none keeps its
// price), then the row's totals and its values per unit of the bill, and the
// bill's count of rows and totals. Stamps what it changes with `userId` and
// `now`.
void recalcBomPrices(Database& db, const std::string& itemId, const std::string& userId, Date now);

// Recounts the rows of the bills and sums their totals.
void refreshBomTotals(Database& db, const std::vector<std::string>& bomIds);

}  // namespace pelta::bll
