// Registration of the headless framework: its classes become creatable by
// programmatic identifier (PeltaCm15.FormExtender ...) through
// pelta::createObject, as the library's class factory creates them.
#pragma once

#include <string>
#include <vector>

namespace pelta::fw {

// Registers every framework class under its identifier. The identifier of
// the framework services answers the one shared instance. May be called more
// than once.
void registerFramework();
void unregisterFramework();
// The identifiers registered.
std::vector<std::string> frameworkProgIds();

}  // namespace pelta::fw
