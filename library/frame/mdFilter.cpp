#include "library/frame/mdFilter.h"

namespace PeltaNom15 {

namespace {

std::string FieldName(std::string_view Field) {
    return "[" + std::string(Field) + "]";
}

}  // namespace

std::string FilterLiteral(std::string_view Text) {
    std::string out = "'";
    for (char c : Text) {
        out += c;
        if (c == '\'') out += '\'';
    }
    return out + "'";
}

std::string LikeEscape(std::string_view Text) {
    std::string out;
    for (char c : Text) {
        switch (c) {
            case '\'':
                out += "''";
                break;
            case '*':
            case '%':
            case '[':
                out += '[';
                out += c;
                out += ']';
                break;
            default:
                out += c;
                break;
        }
    }
    return out;
}

std::string FilterEquals(std::string_view Field, std::string_view Text) {
    return FieldName(Field) + " = " + FilterLiteral(Text);
}

std::string FilterLike(std::string_view Field, std::string_view Text, bool Anywhere) {
    return FieldName(Field) + " LIKE '" + (Anywhere ? "*" : "") + LikeEscape(Text) + "*'";
}

size_t CharCount(std::string_view Text) {
    size_t n = 0;
    for (char c : Text)
        if ((static_cast<unsigned char>(c) & 0xC0) != 0x80) ++n;
    return n;
}

}  // namespace PeltaNom15
