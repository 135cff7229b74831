#include "library/partners/mdCgChecks.h"

#include "library/frame/mdFilter.h"

namespace PeltaNom15 {

namespace {

constexpr const char* kBadLength = "Невалидна дължина";
constexpr const char* kNotDigits = "Съдържанието не е само цифри";
constexpr const char* kBadCheckDigit = "Невалидна контролна цифра";

bool AllDigits(std::string_view Text) {
    for (char c : Text)
        if (c < '0' || c > '9') return false;
    return true;
}

int Digit(std::string_view Text, size_t Index) {
    return Text[Index] - '0';
}

// The check digit of `Count` digits from `First` with two sets of weights:
// the first sum modulo 11 when below 10, else the second's, 10 becoming 0.
int CompanyCheckDigit(std::string_view Number, size_t First, const int* WeightsA,
                      const int* WeightsB, size_t Count) {
    int a = 0, b = 0;
    for (size_t i = 0; i < Count; ++i) {
        a += Digit(Number, First + i) * WeightsA[i];
        b += Digit(Number, First + i) * WeightsB[i];
    }
    if (a % 11 < 10) return a % 11;
    return (b % 11) % 10;
}

std::string_view Trim(std::string_view Text) {
    const auto b = Text.find_first_not_of(" \t");
    if (b == std::string_view::npos) return {};
    return Text.substr(b, Text.find_last_not_of(" \t") - b + 1);
}

}  // namespace

std::string CheckPersonalNumber(std::string_view Number) {
    if (CharCount(Number) != 10) return kBadLength;
    if (!AllDigits(Number)) return kNotDigits;
    static const int kWeights[] = {2, 4, 8, 5, 10, 9, 7, 3, 6};
    int sum = 0;
    for (size_t i = 0; i < 9; ++i)
        sum += Digit(Number, i) * kWeights[i];
    if ((sum % 11) % 10 != Digit(Number, 9)) return kBadCheckDigit;
    return {};
}

std::string CheckCompanyNumber(std::string_view Number) {
    const size_t length = CharCount(Number);
    if (length != 9 && length != 13) return kBadLength;
    if (!AllDigits(Number)) return kNotDigits;
    static const int kA9[] = {1, 2, 3, 4, 5, 6, 7, 8};
    static const int kB9[] = {3, 4, 5, 6, 7, 8, 9, 10};
    if (CompanyCheckDigit(Number, 0, kA9, kB9, 8) != Digit(Number, 8)) return kBadCheckDigit;
    if (length == 13) {
        static const int kA13[] = {2, 7, 3, 5};
        static const int kB13[] = {4, 9, 5, 7};
        if (CompanyCheckDigit(Number, 8, kA13, kB13, 4) != Digit(Number, 12)) return kBadCheckDigit;
    }
    return {};
}

std::string CheckIdentNumber(std::string_view Typed) {
    // The opt-out is read from the text as typed, before anything is trimmed.
    if (Typed.empty() || Typed.front() == ' ') return {};
    const std::string_view number = Trim(Typed);
    if (number.empty() || number.find_first_not_of('9') == std::string_view::npos) return {};
    return CharCount(number) == 10 ? CheckPersonalNumber(number) : CheckCompanyNumber(number);
}

}  // namespace PeltaNom15
