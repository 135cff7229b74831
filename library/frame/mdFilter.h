// Conditions of recordset filters built from text a user typed: every text
// is quoted, and in LIKE patterns its wildcards stand for themselves.
#pragma once

#include <string>
#include <string_view>

namespace PeltaNom15 {

// "'text'" with every "'" doubled.
std::string FilterLiteral(std::string_view Text);
// The text for the inside of a LIKE pattern: "'" doubled, and "*", "%" and
// "[" put in brackets so that they match themselves.
std::string LikeEscape(std::string_view Text);
// "[Field] = 'text'".
std::string FilterEquals(std::string_view Field, std::string_view Text);
// "[Field] LIKE '*text*'" (Anywhere) or "[Field] LIKE 'text*'".
std::string FilterLike(std::string_view Field, std::string_view Text, bool Anywhere = true);
// Characters (not bytes) of a UTF-8 text.
size_t CharCount(std::string_view Text);

}  // namespace PeltaNom15
