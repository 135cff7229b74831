// Checks of a partner's identification number: the personal number (ten
// digits) and the company registry number (nine or thirteen digits), each
// with its check digits.
#pragma once

#include <string>
#include <string_view>

namespace PeltaNom15 {

// Empty when valid, else the reason shown to the user.
std::string CheckPersonalNumber(std::string_view Number);
std::string CheckCompanyNumber(std::string_view Number);

// The identification number as the user typed it: empty when it passes or is
// not to be checked — nothing typed, a leading space (the user's way of
// turning the check off), or nines only. Otherwise the trimmed number is
// checked, ten characters as a personal number and any other length as a
// company number.
std::string CheckIdentNumber(std::string_view Typed);

}  // namespace PeltaNom15
