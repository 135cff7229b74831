// Demo business partners, part of generateDemo.
#pragma once

namespace pelta::bll {

class Database;
struct DemoOptions;

// Fills the partner tables inside the caller's transaction and sets the
// partner parameters (types of natural persons, employees and stores, the
// default partner dimension).
void generatePartnersDemo(Database& db, const DemoOptions& options);

}  // namespace pelta::bll
