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

}  // namespace pelta::bll
