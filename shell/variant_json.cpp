#include "shell/variant_json.h"

#include <cmath>
#include <cstdio>
#include <nlohmann/json.hpp>

#include "platform/automation/decimal.h"
#include "platform/automation/error.h"

namespace pelta::shell {

namespace {

nlohmann::json toJsonDepth(const Variant& v, int depth) {
    switch (v.type()) {
        case VarType::Boolean:
            return v.rawBool();
        case VarType::Byte:
        case VarType::Integer:
        case VarType::Long:
            return v.toLong();
        case VarType::Double: {
            double d = v.rawDouble();
            return std::isfinite(d) ? nlohmann::json(d) : nlohmann::json();
        }
        case VarType::Currency:
        case VarType::Decimal:
            return v.toString();
        case VarType::Date:
            return formatIsoDate(v.toDate());
        case VarType::String:
            return v.str();
        case VarType::Array: {
            if (depth > 8) return nullptr;
            auto out = nlohmann::json::array();
            for (const Variant& e : v.array())
                out.push_back(toJsonDepth(e, depth + 1));
            return out;
        }
        default:
            return nullptr;
    }
}

bool digits(const std::string& s, size_t at, size_t n, int& out) {
    if (at + n > s.size()) return false;
    out = 0;
    for (size_t i = at; i < at + n; ++i) {
        if (s[i] < '0' || s[i] > '9') return false;
        out = out * 10 + (s[i] - '0');
    }
    return true;
}

[[noreturn]] void mismatch(const std::string& what) {
    pelta::raise(pelta::errc::TypeMismatch, "The value is not " + what, "pelta.shell");
}

}  // namespace

nlohmann::json toJson(const Variant& value) {
    return toJsonDepth(value, 0);
}

bool parseIsoDate(const std::string& s, Date& out) {
    int y, mo, d, h = 0, mi = 0, sec = 0;
    if (!digits(s, 0, 4, y) || s.size() < 10 || s[4] != '-' || !digits(s, 5, 2, mo) ||
        s[7] != '-' || !digits(s, 8, 2, d))
        return false;
    if (s.size() > 10) {
        if ((s[10] != 'T' && s[10] != ' ') || !digits(s, 11, 2, h) || s.size() < 16 ||
            s[13] != ':' || !digits(s, 14, 2, mi))
            return false;
        if (s.size() > 16 && (s[16] != ':' || !digits(s, 17, 2, sec) || s.size() != 19))
            return false;
    }
    static const int kDays[] = {31, 29, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    if (y < 100 || mo < 1 || mo > 12 || d < 1 || d > kDays[mo - 1] || h > 23 || mi > 59 || sec > 59)
        return false;
    bool leap = (y % 4 == 0 && y % 100 != 0) || y % 400 == 0;
    if (mo == 2 && d == 29 && !leap) return false;
    out = makeDate(y, mo, d, h, mi, sec);
    return true;
}

std::string formatIsoDate(Date date) {
    DateParts p = splitDate(date);
    char buf[32];
    if (p.hour == 0 && p.minute == 0 && p.second == 0)
        std::snprintf(buf, sizeof buf, "%04d-%02d-%02d", p.year, p.month, p.day);
    else
        std::snprintf(buf, sizeof buf, "%04d-%02d-%02dT%02d:%02d:%02d", p.year, p.month, p.day,
                      p.hour, p.minute, p.second);
    return buf;
}

Variant fromJson(const nlohmann::json& value, const std::string& kind) {
    if (value.is_null()) return Variant::null();
    if (kind == "check") {
        if (value.is_boolean()) return Variant(value.get<bool>());
        if (value.is_number_integer()) return Variant(value.get<int64_t>() != 0);
        mismatch("a check mark");
    }
    if (kind == "number") {
        if (value.is_number_integer()) return Variant::fromInt64(value.get<int64_t>());
        if (value.is_number_float()) return Variant(value.get<double>());
        if (value.is_string()) {
            std::string text = value.get<std::string>();
            if (text.empty()) return Variant::null();
            if (auto d = Decimal::parse(text)) return Variant(*d);
        }
        mismatch("a number");
    }
    if (kind == "date") {
        if (value.is_string()) {
            std::string text = value.get<std::string>();
            if (text.empty()) return Variant::null();
            Date d;
            if (parseIsoDate(text, d)) return Variant(d);
        }
        mismatch("a date");
    }
    if (value.is_string()) return Variant(value.get<std::string>());
    if (value.is_boolean()) return Variant(value.get<bool>());
    if (value.is_number_integer()) return Variant::fromInt64(value.get<int64_t>());
    if (value.is_number_float()) return Variant(value.get<double>());
    mismatch("a text");
}

}  // namespace pelta::shell
