// Items inside the service: the code lists kept on each item and the demo
// catalogue.
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace pelta::bll {

class Database;

// Entries each preceded by U+007F, the last also followed by it; empty for
// no entries.
std::string composeCodeList(const std::vector<std::string>& entries);
// The leading digits of a weight-barcode template ("2101234ww.wwwc" gives
// "2101234"); empty for an ordinary barcode.
std::string barcodePrefix(std::string_view barcode);
// Composes the item's BarCodes, BarPrefixes, BarMeasures, SupplCodes and
// SupplMeasures from its barcodes and supplier codes (in the order they were
// entered), and Categories from its group and its other dimension values.
// Every write of an item's codes or dimension values ends with it.
void refreshItemCodeLists(Database& db, const std::string& itemId);

}  // namespace pelta::bll
