// Values between the automation world and the page's JSON.
#pragma once

#include <nlohmann/json_fwd.hpp>
#include <string>

#include "platform/automation/variant.h"

namespace pelta::shell {

// Empty, Null and objects become null; numbers stay numbers, except exact
// decimals and currency, which travel as text so that no digit is lost; dates
// become "YYYY-MM-DD" or "YYYY-MM-DDTHH:MM:SS".
nlohmann::json toJson(const Variant& value);

// A value the person typed into a control of `kind` ("text", "number", "date",
// "check" ...). Raises pelta::Error (13, type mismatch) when the text does not
// fit the kind.
Variant fromJson(const nlohmann::json& value, const std::string& kind);

// "YYYY-MM-DD", optionally followed by "THH:MM" or "THH:MM:SS".
bool parseIsoDate(const std::string& text, Date& out);
std::string formatIsoDate(Date date);

}  // namespace pelta::shell
