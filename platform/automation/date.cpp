// The automation Date kind: days since 1899-12-30 with the time of day as the
// fraction. Before that day the value is negative but the fraction still
// counts forward from midnight: -1.25 is 1899-12-29 06:00.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <ctime>

#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace pelta {

namespace {

constexpr int64_t kMsPerDay = 86400000;
// Days from 1970-01-01 to 1899-12-30.
constexpr int64_t kEpochShift = -25569;
// The range of the Date kind: 0100-01-01 to 9999-12-31.
constexpr int64_t kMinDay = -657434;
constexpr int64_t kMaxDay = 2958465;

int64_t floorDiv(int64_t a, int64_t b) noexcept {
    int64_t q = a / b;
    return (a % b != 0 && (a < 0) != (b < 0)) ? q - 1 : q;
}

// Days since 1970-01-01 of a proleptic Gregorian date (month 1..12).
int64_t daysFromCivil(int64_t y, int64_t m, int64_t d) noexcept {
    y -= m <= 2;
    int64_t era = floorDiv(y, 400);
    int64_t yoe = y - era * 400;
    int64_t doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
    int64_t doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
    return era * 146097 + doe - 719468;
}

void civilFromDays(int64_t z, int& year, int& month, int& day) noexcept {
    z += 719468;
    int64_t era = floorDiv(z, 146097);
    int64_t doe = z - era * 146097;
    int64_t yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
    int64_t doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
    int64_t mp = (5 * doy + 2) / 153;
    day = static_cast<int>(doy - (153 * mp + 2) / 5 + 1);
    month = static_cast<int>(mp < 10 ? mp + 3 : mp - 9);
    year = static_cast<int>(yoe + era * 400 + (month <= 2));
}

bool isLeap(int y) noexcept {
    return (y % 4 == 0 && y % 100 != 0) || y % 400 == 0;
}

int daysInMonth(int y, int m) noexcept {
    static constexpr int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    return m == 2 && isLeap(y) ? 29 : kDays[m - 1];
}

// Day number and milliseconds of the day, the latter rounded to `unitMs`.
void splitSerial(double oa, int64_t unitMs, int64_t& day, int64_t& ms) {
    if (!(oa > kMinDay - 1 && oa < kMaxDay + 1)) raise(errc::Overflow, {});
    double whole = std::trunc(oa);
    double frac = std::fabs(oa - whole);
    day = static_cast<int64_t>(whole);
    ms = std::llround(frac * static_cast<double>(kMsPerDay / unitMs)) * unitMs;
    if (ms >= kMsPerDay) {
        ms -= kMsPerDay;
        ++day;  // the next day, forward in time for negative serials too
    }
}

Date fromDayAndMs(int64_t day, int64_t ms) {
    if (day < kMinDay || day > kMaxDay) raise(errc::Overflow, {});
    double frac = static_cast<double>(ms) / static_cast<double>(kMsPerDay);
    return Date{day >= 0 ? static_cast<double>(day) + frac : static_cast<double>(day) - frac};
}

// --- parsing ---------------------------------------------------------------

struct Cursor {
    std::string_view s;
    size_t i = 0;

    bool done() const noexcept { return i == s.size(); }
    bool eat(char c) noexcept {
        if (i < s.size() && s[i] == c) {
            ++i;
            return true;
        }
        return false;
    }
    // An unsigned number of minDigits..maxDigits digits.
    bool number(int minDigits, int maxDigits, int& out, int* count = nullptr) noexcept {
        int n = 0, v = 0;
        while (i < s.size() && n < maxDigits && s[i] >= '0' && s[i] <= '9') {
            v = v * 10 + (s[i++] - '0');
            ++n;
        }
        if (count) *count = n;
        out = v;
        return n >= minDigits;
    }
    void skipSpaces() noexcept {
        while (i < s.size() && (s[i] == ' ' || s[i] == '\t'))
            ++i;
    }
};

struct Parts {
    int year = 1899, month = 12, day = 30, hour = 0, minute = 0, second = 0, ms = 0;
};

// "hh:nn[:ss[.fff]]"; fractions of a second only when `fraction`.
bool parseTime(Cursor& c, Parts& p, bool fraction) noexcept {
    if (!c.number(1, 2, p.hour) || !c.eat(':') || !c.number(2, 2, p.minute)) return false;
    if (c.eat(':')) {
        if (!c.number(2, 2, p.second)) return false;
        if (fraction && c.eat('.')) {
            int digits = 0;
            if (!c.number(1, 3, p.ms, &digits)) return false;
            for (; digits < 3; ++digits)
                p.ms *= 10;
            while (!c.done() && c.s[c.i] >= '0' && c.s[c.i] <= '9')
                ++c.i;  // beyond ms
        }
    }
    return p.hour <= 23 && p.minute <= 59 && p.second <= 59;
}

bool validDate(const Parts& p) noexcept {
    return p.year >= 100 && p.year <= 9999 && p.month >= 1 && p.month <= 12 && p.day >= 1 &&
           p.day <= daysInMonth(p.year, p.month);
}

bool parseParts(std::string_view text, Parts& p, bool& hasDate) noexcept {
    Cursor c{text};
    c.skipSpaces();
    size_t start = c.i;
    int first = 0, digits = 0;
    if (!c.number(1, 4, first, &digits)) return false;
    hasDate = true;
    if (digits == 4 && c.eat('-')) {
        // ISO: yyyy-mm-dd[(T| )hh:nn[:ss[.fff]]]
        p.year = first;
        if (!c.number(2, 2, p.month) || !c.eat('-') || !c.number(2, 2, p.day)) return false;
        if (c.eat('T') || (c.eat(' ') && (c.skipSpaces(), !c.done()))) {
            if (!parseTime(c, p, true)) return false;
        }
    } else if (digits <= 2 && c.eat('.')) {
        // dd.mm.yyyy[ hh:nn[:ss]], optionally with the year mark "г." after the year
        p.day = first;
        int yearDigits = 0;
        if (!c.number(1, 2, p.month) || !c.eat('.') || !c.number(2, 4, p.year, &yearDigits) ||
            yearDigits == 3)
            return false;
        if (yearDigits == 2) p.year += p.year < 30 ? 2000 : 1900;  // as the two-digit year window
        size_t afterYear = c.i;
        c.skipSpaces();
        if (c.s.substr(c.i, 3) == "\xD0\xB3.") {  // the year mark "г."
            c.i += 3;
            afterYear = c.i;
            c.skipSpaces();
        }
        if (!c.done() && (c.i == afterYear || !parseTime(c, p, false))) return false;
    } else if (digits <= 2 && c.s.substr(c.i, 1) == ":") {
        hasDate = false;
        c.i = start;
        if (!parseTime(c, p, false)) return false;
    } else {
        return false;
    }
    c.skipSpaces();
    return c.done() && (!hasDate || validDate(p));
}

void appendNumber(std::string& out, int v, int width) {
    char buf[16];
    int n = std::snprintf(buf, sizeof buf, "%0*d", width, v);
    out.append(buf, static_cast<size_t>(n));
}

}  // namespace

Date makeDate(int year, int month, int day, int hour, int minute, int second, int millisecond) {
    // Out-of-range parts roll over as DateSerial and TimeSerial do: month 13 is
    // January of the next year, day 0 the last day of the previous month.
    int64_t m0 = static_cast<int64_t>(month) - 1;
    int64_t y = year + floorDiv(m0, 12);
    int64_t m = m0 - floorDiv(m0, 12) * 12 + 1;
    int64_t days = daysFromCivil(y, m, 1) - kEpochShift + (static_cast<int64_t>(day) - 1);
    int64_t ms = ((static_cast<int64_t>(hour) * 60 + minute) * 60 + second) * 1000 + millisecond;
    days += floorDiv(ms, kMsPerDay);
    ms -= floorDiv(ms, kMsPerDay) * kMsPerDay;
    return fromDayAndMs(days, ms);
}

DateParts splitDate(Date d) {
    int64_t day = 0, ms = 0;
    splitSerial(d.oa, 1, day, ms);
    DateParts p{};
    civilFromDays(day + kEpochShift, p.year, p.month, p.day);
    p.hour = static_cast<int>(ms / 3600000);
    p.minute = static_cast<int>(ms / 60000 % 60);
    p.second = static_cast<int>(ms / 1000 % 60);
    p.millisecond = static_cast<int>(ms % 1000);
    p.weekday = static_cast<int>((day + 6) - floorDiv(day + 6, 7) * 7) + 1;  // day 0 was a Saturday
    return p;
}

Date now() {
    timespec ts{};
    clock_gettime(CLOCK_REALTIME, &ts);
    tm local{};
    localtime_r(&ts.tv_sec, &local);
    return makeDate(local.tm_year + 1900, local.tm_mon + 1, local.tm_mday, local.tm_hour,
                    local.tm_min, local.tm_sec, static_cast<int>(ts.tv_nsec / 1000000));
}

bool parseDate(std::string_view text, Date& out) noexcept {
    Parts p;
    bool hasDate = false;
    if (!parseParts(text, p, hasDate)) return false;
    int64_t ms = ((static_cast<int64_t>(p.hour) * 60 + p.minute) * 60 + p.second) * 1000 + p.ms;
    int64_t day = hasDate ? daysFromCivil(p.year, p.month, p.day) - kEpochShift : 0;
    try {
        out = fromDayAndMs(day, ms);
    } catch (const Error&) {
        return false;
    }
    return true;
}

std::string formatDate(Date d, std::string_view pattern) {
    // Shown times are rounded to the second, as the language shows them.
    int64_t day = 0, ms = 0;
    splitSerial(d.oa, 1000, day, ms);
    int year = 0, month = 0, mday = 0;
    civilFromDays(day + kEpochShift, year, month, mday);
    int hour = static_cast<int>(ms / 3600000);
    int minute = static_cast<int>(ms / 60000 % 60);
    int second = static_cast<int>(ms / 1000 % 60);

    std::string out;
    size_t i = 0;
    auto run = [&](char c) {
        size_t n = 0;
        while (i + n < pattern.size() && pattern[i + n] == c)
            ++n;
        return n;
    };
    while (i < pattern.size()) {
        char c = pattern[i];
        size_t n = run(c);
        switch (c) {
            case 'y':
                if (n >= 4) {
                    appendNumber(out, year, 4);  // "0100": reads back as four digits
                    n = 4;
                } else if (n >= 2) {
                    appendNumber(out, year % 100, 2);
                    n = 2;
                } else {
                    out += c;  // a lone "y" (day of the year) is not supported
                }
                break;
            case 'm':
                n = std::min<size_t>(n, 2), appendNumber(out, month, static_cast<int>(n));
                break;
            case 'd':
                n = std::min<size_t>(n, 2), appendNumber(out, mday, static_cast<int>(n));
                break;
            case 'h':
                n = std::min<size_t>(n, 2), appendNumber(out, hour, static_cast<int>(n));
                break;
            case 'n':
                n = std::min<size_t>(n, 2), appendNumber(out, minute, static_cast<int>(n));
                break;
            case 's':
                n = std::min<size_t>(n, 2), appendNumber(out, second, static_cast<int>(n));
                break;
            case '\\':
                n = 1;
                if (i + 1 < pattern.size()) out += pattern[i + 1], n = 2;
                break;
            case '"': {
                size_t end = pattern.find('"', i + 1);
                if (end == std::string_view::npos) end = pattern.size();
                out.append(pattern.substr(i + 1, end - i - 1));
                n = end < pattern.size() ? end - i + 1 : end - i;
                break;
            }
            default:
                n = 1, out += c;
                break;
        }
        i += n;
    }
    return out;
}

}  // namespace pelta
