// The demo catalogue of items, written by generateDemo.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace pelta::bll {

class Database;

struct DemoItemsContext {
    // The currencies written before: the national currency first, then EUR.
    std::vector<std::string> currencyIds;
};

// Writes `count` items and what they need; sets DefPriceList_ID to the
// retail price-list type. Runs inside the caller's transaction.
void generateDemoItems(Database& db, const DemoItemsContext& context, int count, uint64_t seed);
// Writes the reference lists of the item's detail form (duty tariffs, a tree
// of directions, Intrastat codes with a default, shelves, roundings), lots
// and bills of materials of the last items, and with `priceTypes` the
// supplier price-list type (SupplPriceList_ID) and a price list generated
// from the default one. Runs after generateDemoItems, inside the caller's
// transaction.
void generateDemoItemDetails(Database& db, uint64_t seed, bool priceTypes);

}  // namespace pelta::bll
