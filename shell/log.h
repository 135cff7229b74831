// The shell's diagnostic log: one line per entry on standard error, in English.
#pragma once

#include <string_view>

namespace pelta::shell {

void logLine(std::string_view line);

}  // namespace pelta::shell
