#include "platform/data/filter.h"

#include <charconv>
#include <cmath>
#include <cstring>
#include <optional>

#include "platform/automation/error.h"
#include "platform/automation/guid.h"
#include "platform/data/collation.h"

namespace pelta::rsimpl {

namespace {

// ---------------------------------------------------------------------------
// Case-insensitive text matching. The pattern is folded once. A pattern of
// ASCII characters is matched directly against the text bytes; only the two
// non-ASCII characters whose simple case folding is ASCII (U+017F long s,
// U+212A Kelvin sign) force the general path, which folds the text.

struct FoldTable {
    uint8_t lower[256];
    constexpr FoldTable() : lower() {
        for (int i = 0; i < 256; ++i)
            lower[i] = static_cast<uint8_t>(i >= 'A' && i <= 'Z' ? i + 32 : i);
    }
};
constexpr FoldTable kFold;

// The text holds U+017F (C5 BF) or U+212A (E2 84 AA).
bool hasAsciiFoldingChar(std::string_view t) noexcept {
    const auto* p = reinterpret_cast<const uint8_t*>(t.data());
    const size_t n = t.size();
    for (size_t i = 0; i + 1 < n; ++i) {
        if (p[i] == 0xC5 && p[i + 1] == 0xBF) return true;
        if (p[i] == 0xE2 && i + 2 < n && p[i + 1] == 0x84 && p[i + 2] == 0xAA) return true;
    }
    return false;
}

enum class TextMode : uint8_t { Equal, Prefix, Suffix, Contains, Any };

class TextMatcher {
public:
    void init(std::string_view pattern, TextMode mode) {
        pat_ = foldCase(pattern);
        mode_ = mode;
        ascii_ = true;
        for (char c : pat_)
            if (static_cast<uint8_t>(c) >= 0x80) ascii_ = false;
    }

    bool match(std::string_view t) const {
        if (ascii_) {
            int r = fastMatch(t);
            if (r >= 0) return r != 0;
        }
        return slowMatch(t);
    }

    int compare(std::string_view t) const {
        std::string& f = buffer();
        f.clear();
        foldCaseAppend(t, f);
        int c = f.compare(pat_);
        return c < 0 ? -1 : c > 0 ? 1 : 0;
    }

private:
    static std::string& buffer() {
        thread_local std::string b;
        return b;
    }

    // 1 match, 0 no match, -1 undecided.
    int fastMatch(std::string_view text) const {
        const auto* t = reinterpret_cast<const uint8_t*>(text.data());
        const auto* p = reinterpret_cast<const uint8_t*>(pat_.data());
        const size_t n = text.size(), m = pat_.size();
        switch (mode_) {
            case TextMode::Any:
                return 1;
            case TextMode::Equal:
                if (n < m) return 0;
                if (n == m) {
                    for (size_t i = 0; i < m; ++i)
                        if (kFold.lower[t[i]] != p[i]) return 0;
                    return 1;
                }
                return hasAsciiFoldingChar(text) ? -1 : 0;
            case TextMode::Prefix:
                for (size_t j = 0; j < m; ++j) {
                    if (j >= n) return 0;
                    uint8_t c = t[j];
                    if (c >= 0x80) return (c == 0xC5 || c == 0xE2) ? -1 : 0;
                    if (kFold.lower[c] != p[j]) return 0;
                }
                return 1;
            case TextMode::Suffix:
                for (size_t j = 0; j < m; ++j) {
                    if (j >= n) return 0;
                    uint8_t c = t[n - 1 - j];
                    if (c >= 0x80) return (c == 0xBF || c == 0xAA) ? -1 : 0;
                    if (kFold.lower[c] != p[m - 1 - j]) return 0;
                }
                return 1;
            case TextMode::Contains: {
                if (m == 0) return 1;
                if (n >= m) {
                    const uint8_t p0 = p[0];
                    const size_t last = n - m;
                    for (size_t i = 0; i <= last; ++i) {
                        if (kFold.lower[t[i]] != p0) continue;
                        size_t k = 1;
                        while (k < m && kFold.lower[t[i + k]] == p[k])
                            ++k;
                        if (k == m) return 1;
                    }
                }
                return hasAsciiFoldingChar(text) ? -1 : 0;
            }
        }
        return -1;
    }

    bool slowMatch(std::string_view t) const {
        std::string& f = buffer();
        f.clear();
        foldCaseAppend(t, f);
        std::string_view fv(f);
        switch (mode_) {
            case TextMode::Any:
                return true;
            case TextMode::Equal:
                return fv == pat_;
            case TextMode::Prefix:
                return fv.starts_with(pat_);
            case TextMode::Suffix:
                return fv.ends_with(pat_);
            case TextMode::Contains:
                return fv.find(pat_) != std::string_view::npos;
        }
        return false;
    }

    std::string pat_;
    TextMode mode_ = TextMode::Equal;
    bool ascii_ = true;
};

// ---------------------------------------------------------------------------
// Lexer.

enum class Tok : uint8_t { End, Name, LParen, RParen, Comma, Op, String, Date, Number, GuidLit };
enum class Op : uint8_t { Eq, Ne, Lt, Gt, Le, Ge, Like, IsNull, NotNull };

struct Token {
    Tok kind = Tok::End;
    std::string text;  // decoded
    size_t pos = 0;    // byte offset in the criteria
    bool bracketed = false;
    Op op = Op::Eq;
};

size_t charPosition(std::string_view s, size_t byteOffset) {
    size_t n = 1;
    for (size_t i = 0; i < byteOffset && i < s.size(); ++i)
        if ((static_cast<uint8_t>(s[i]) & 0xC0) != 0x80) ++n;
    return n;
}

bool isIdentStart(uint8_t c) {
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || c == '_' || c >= 0x80;
}
bool isIdentChar(uint8_t c) {
    return isIdentStart(c) || (c >= '0' && c <= '9');
}
bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

bool keywordIs(const Token& t, std::string_view kw) {
    if (t.kind != Tok::Name || t.bracketed || t.text.size() != kw.size()) return false;
    for (size_t i = 0; i < kw.size(); ++i)
        if (kFold.lower[static_cast<uint8_t>(t.text[i])] !=
            kFold.lower[static_cast<uint8_t>(kw[i])])
            return false;
    return true;
}

class Lexer {
public:
    Lexer(std::string_view s, const char* context) : s_(s), context_(context) {}

    [[noreturn]] void fail(size_t bytePos, const std::string& what) const {
        std::string d = std::string(context_) + ": invalid criteria at position " +
                        std::to_string(charPosition(s_, bytePos)) + ": " + what;
        raiseRs(rserr::InvalidArgument, std::move(d));
    }

    Token next() {
        while (i_ < s_.size() &&
               (s_[i_] == ' ' || s_[i_] == '\t' || s_[i_] == '\r' || s_[i_] == '\n'))
            ++i_;
        Token t;
        t.pos = i_;
        if (i_ >= s_.size()) return t;
        char c = s_[i_];
        switch (c) {
            case '(':
                ++i_, t.kind = Tok::LParen;
                return t;
            case ')':
                ++i_, t.kind = Tok::RParen;
                return t;
            case ',':
                ++i_, t.kind = Tok::Comma;
                return t;
            case '=':
                ++i_, t.kind = Tok::Op, t.op = Op::Eq;
                return t;
            case '<':
                ++i_, t.kind = Tok::Op, t.op = Op::Lt;
                if (i_ < s_.size() && s_[i_] == '>')
                    ++i_, t.op = Op::Ne;
                else if (i_ < s_.size() && s_[i_] == '=')
                    ++i_, t.op = Op::Le;
                return t;
            case '>':
                ++i_, t.kind = Tok::Op, t.op = Op::Gt;
                if (i_ < s_.size() && s_[i_] == '=') ++i_, t.op = Op::Ge;
                return t;
            case '\'': {
                t.kind = Tok::String;
                ++i_;
                for (;;) {
                    if (i_ >= s_.size()) fail(t.pos, "text without its closing quote");
                    if (s_[i_] == '\'') {
                        if (i_ + 1 < s_.size() && s_[i_ + 1] == '\'') {
                            t.text.push_back('\'');
                            i_ += 2;
                            continue;
                        }
                        ++i_;
                        return t;
                    }
                    t.text.push_back(s_[i_++]);
                }
            }
            case '#':
                return delimited(t, Tok::Date, '#', "date without its closing '#'", false);
            case '[': {
                delimited(t, Tok::Name, ']', "field name without its closing ']'", false);
                t.bracketed = true;
                if (t.text.empty()) fail(t.pos, "empty field name");
                return t;
            }
            case '{':
                return delimited(t, Tok::GuidLit, '}', "GUID without its closing '}'", true);
            default:
                break;
        }
        if (isDigit(c) || ((c == '-' || c == '+' || c == '.') && i_ + 1 < s_.size() &&
                           (isDigit(s_[i_ + 1]) || s_[i_ + 1] == '.'))) {
            t.kind = Tok::Number;
            size_t b = i_;
            if (c == '-' || c == '+') ++i_;
            bool digits = false;
            while (i_ < s_.size() && isDigit(s_[i_]))
                ++i_, digits = true;
            if (i_ < s_.size() && s_[i_] == '.') {
                ++i_;
                while (i_ < s_.size() && isDigit(s_[i_]))
                    ++i_, digits = true;
            }
            if (!digits) fail(b, "malformed number");
            if (i_ < s_.size() && (s_[i_] == 'e' || s_[i_] == 'E')) {
                size_t e = i_++;
                if (i_ < s_.size() && (s_[i_] == '-' || s_[i_] == '+')) ++i_;
                if (i_ >= s_.size() || !isDigit(s_[i_])) fail(e, "malformed exponent");
                while (i_ < s_.size() && isDigit(s_[i_]))
                    ++i_;
            }
            if (i_ < s_.size() && isIdentChar(static_cast<uint8_t>(s_[i_])))
                fail(i_, "unexpected character after a number");
            t.text.assign(s_.substr(b, i_ - b));
            return t;
        }
        if (isIdentStart(static_cast<uint8_t>(c))) {
            t.kind = Tok::Name;
            size_t b = i_;
            while (i_ < s_.size() && isIdentChar(static_cast<uint8_t>(s_[i_])))
                ++i_;
            t.text.assign(s_.substr(b, i_ - b));
            return t;
        }
        fail(i_, std::string("unexpected character '") + c + "'");
    }

private:
    Token& delimited(Token& t, Tok kind, char close, const char* unterminated, bool keepDelims) {
        t.kind = kind;
        size_t b = i_++;
        size_t e = s_.find(close, i_);
        if (e == std::string_view::npos) fail(b, unterminated);
        t.text.assign(keepDelims ? s_.substr(b, e + 1 - b) : s_.substr(i_, e - i_));
        i_ = e + 1;
        return t;
    }

    std::string_view s_;
    const char* context_;
    size_t i_ = 0;
};

// ---------------------------------------------------------------------------
// Dates.

int64_t daysFromCivil(int64_t y, unsigned m, unsigned d) {
    y -= m <= 2;
    const int64_t era = (y >= 0 ? y : y - 399) / 400;
    const unsigned yoe = static_cast<unsigned>(y - era * 400);
    const unsigned doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
    const unsigned doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
    return era * 146097 + static_cast<int64_t>(doe) - 719468;
}

bool leap(int y) {
    return (y % 4 == 0 && y % 100 != 0) || y % 400 == 0;
}

bool readInt(std::string_view s, size_t& i, int maxDigits, int& v) {
    size_t b = i;
    v = 0;
    while (i < s.size() && isDigit(s[i]) && static_cast<int>(i - b) < maxDigits)
        v = v * 10 + (s[i++] - '0');
    return i > b;
}

// Cuts the string in place: returns whether `sep` is at i and skips it.
bool skip(std::string_view s, size_t& i, char sep) {
    if (i < s.size() && s[i] == sep) {
        ++i;
        return true;
    }
    return false;
}

std::string_view trim(std::string_view s) {
    while (!s.empty() && (s.front() == ' ' || s.front() == '\t'))
        s.remove_prefix(1);
    while (!s.empty() && (s.back() == ' ' || s.back() == '\t'))
        s.remove_suffix(1);
    return s;
}

}  // namespace

bool parseDateLiteral(std::string_view text, double& oa) {
    std::string_view s = trim(text);
    size_t i = 0;
    int a = 0, b = 0, c = 0, y = 0, m = 0, d = 0;
    if (!readInt(s, i, 4, a)) return false;
    bool us = false;
    if (i == 4 && skip(s, i, '-')) {  // yyyy-mm-dd
        if (!readInt(s, i, 2, b) || !skip(s, i, '-') || !readInt(s, i, 2, c)) return false;
        y = a, m = b, d = c;
    } else if (skip(s, i, '/')) {  // m/d/yyyy
        if (!readInt(s, i, 2, b) || !skip(s, i, '/') || !readInt(s, i, 4, c)) return false;
        m = a, d = b, y = c;
        us = true;
    } else if (skip(s, i, '.')) {  // d.m.yyyy
        if (!readInt(s, i, 2, b) || !skip(s, i, '.') || !readInt(s, i, 4, c)) return false;
        d = a, m = b, y = c;
        skip(s, i, '.');
    } else {
        Date parsed;
        if (!parseDate(text, parsed)) return false;
        oa = parsed.oa;
        return true;
    }
    if (m < 1 || m > 12 || d < 1 || y < 100 || y > 9999) return false;
    static constexpr int kDays[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    if (d > kDays[m - 1] + (m == 2 && leap(y) ? 1 : 0)) return false;
    int hh = 0, nn = 0, ss = 0;
    if (i < s.size()) {
        if (s[i] != ' ' && s[i] != 'T') return false;
        while (i < s.size() && (s[i] == ' ' || s[i] == 'T'))
            ++i;
        if (!readInt(s, i, 2, hh) || !skip(s, i, ':') || !readInt(s, i, 2, nn)) return false;
        if (skip(s, i, ':') && !readInt(s, i, 2, ss)) return false;
        while (i < s.size() && s[i] == ' ')
            ++i;
        if (us && i + 2 <= s.size()) {
            std::string ampm = foldCase(s.substr(i, 2));
            if (ampm == "am" || ampm == "pm") {
                if (hh < 1 || hh > 12) return false;
                if (ampm == "pm" && hh != 12) hh += 12;
                if (ampm == "am" && hh == 12) hh = 0;
                i += 2;
            }
        }
        if (i != s.size() || hh > 23 || nn > 59 || ss > 59) return false;
    }
    const int64_t day = daysFromCivil(y, static_cast<unsigned>(m), static_cast<unsigned>(d)) -
                        daysFromCivil(1899, 12, 30);
    const double frac = (hh * 3600 + nn * 60 + ss) / 86400.0;
    oa = day >= 0 ? static_cast<double>(day) + frac : static_cast<double>(day) - frac;
    return true;
}

// ---------------------------------------------------------------------------
// Compiled tree.

namespace {

enum class NodeKind : uint8_t { Leaf, And, Or };

inline bool testOrder(Op op, int c) {
    switch (op) {
        case Op::Eq:
            return c == 0;
        case Op::Ne:
            return c != 0;
        case Op::Lt:
            return c == -1;
        case Op::Gt:
            return c == 1;
        case Op::Le:
            return c == -1 || c == 0;
        case Op::Ge:
            return c == 1 || c == 0;
        default:
            return false;
    }
}

template <class T>
inline int order(T a, T b) {
    return a < b ? -1 : b < a ? 1 : a == b ? 0 : 2;  // 2: unordered (NaN)
}

// Plain decimal text (no exponent) to value * 10^4: floor and inexactness.
// Returns false on overflow of int64, with `sign` telling which side.
bool parseScaled(std::string_view s, int64_t& floorScaled, bool& inexact, int& sign) {
    bool neg = false;
    size_t i = 0;
    if (i < s.size() && (s[i] == '-' || s[i] == '+')) neg = s[i++] == '-';
    sign = neg ? -1 : 1;
    uint64_t v = 0;
    bool big = false;
    auto push = [&](unsigned d) {
        if (big) return;
        if (v > (UINT64_MAX - d) / 10) {
            big = true;
            return;
        }
        v = v * 10 + d;
    };
    while (i < s.size() && isDigit(s[i]))
        push(static_cast<unsigned>(s[i++] - '0'));
    int frac = 0;
    inexact = false;
    if (i < s.size() && s[i] == '.') {
        ++i;
        for (; i < s.size() && isDigit(s[i]); ++i) {
            if (frac < 4) {
                push(static_cast<unsigned>(s[i] - '0'));
                ++frac;
            } else if (s[i] != '0') {
                inexact = true;
            }
        }
    }
    for (; frac < 4; ++frac)
        push(0);
    if (big) return false;
    const uint64_t maxPositive = static_cast<uint64_t>(INT64_MAX);
    if (!neg) {
        if (v > maxPositive) return false;
        floorScaled = static_cast<int64_t>(v);
        return true;
    }
    // Negative: the floor of -(v + fraction) is -(v + 1) when inexact.
    if (inexact) {
        if (v == UINT64_MAX) return false;
        ++v;
    }
    if (v > maxPositive + 1) return false;
    floorScaled = v == maxPositive + 1 ? INT64_MIN : -static_cast<int64_t>(v);
    return true;
}

}  // namespace

struct Filter::Node {
    NodeKind kind = NodeKind::Leaf;
    std::vector<uint32_t> children;
    // Leaf.
    uint32_t field = 0;
    FieldType type = FieldType::Text;
    Op op = Op::Eq;
    double num = 0;
    int64_t cur = 0;
    bool curInexact = false;
    int curOverflow = 0;  // -1: below every value, 1: above every value
    Decimal dec;
    std::array<uint8_t, 16> guid{};
    TextMatcher text;

    int compareCurrency(int64_t v) const {
        if (curOverflow) return -curOverflow;
        if (curInexact) return v <= cur ? -1 : 1;
        return v < cur ? -1 : v > cur ? 1 : 0;
    }

    bool leafMatch(const Column& col, uint32_t r) const {
        if (op == Op::IsNull) return col.isNull(r);
        if (op == Op::NotNull) return !col.isNull(r);
        if (col.isNull(r)) return false;
        switch (type) {
            case FieldType::Boolean:
                return testOrder(op, order<double>(col.b[r] ? 1 : 0, num));
            case FieldType::Long:
                return testOrder(op, order<double>(col.i32[r], num));
            case FieldType::Double:
            case FieldType::Date:
                return testOrder(op, order<double>(col.f64[r], num));
            case FieldType::Currency:
                return testOrder(op, compareCurrency(col.i64[r]));
            case FieldType::Decimal: {
                auto c = col.dec[r] <=> dec;
                return testOrder(op, c < 0 ? -1 : c > 0 ? 1 : 0);
            }
            case FieldType::Guid: {
                int c = std::memcmp(col.guid[r].data(), guid.data(), 16);
                return testOrder(op, c < 0 ? -1 : c > 0 ? 1 : 0);
            }
            case FieldType::Text:
            case FieldType::LongText:
                if (op == Op::Eq || op == Op::Like) return text.match(col.text(r));
                if (op == Op::Ne) return !text.match(col.text(r));
                return testOrder(op, text.compare(col.text(r)));
            case FieldType::Binary:
                return false;
        }
        return false;
    }
};

Filter::Filter() = default;
Filter::~Filter() = default;

class FilterParser {
public:
    FilterParser(const Table& t, std::string_view s, bool single, const char* context)
        : t_(t), s_(s), lex_(s, context), single_(single), f_(new Filter()) {}

    std::shared_ptr<const Filter> run() {
        tok_ = lex_.next();
        if (tok_.kind == Tok::End) lex_.fail(0, "empty criteria");
        parseOr(0);
        if (tok_.kind != Tok::End) lex_.fail(tok_.pos, "unexpected text");
        return std::shared_ptr<const Filter>(f_.release());
    }

private:
    static constexpr int kMaxDepth = 64;

    void advance() { tok_ = lex_.next(); }

    uint32_t addNode(Filter::Node n) {
        f_->nodes_.push_back(std::move(n));
        return static_cast<uint32_t>(f_->nodes_.size() - 1);
    }

    uint32_t parseOr(int depth) {
        uint32_t first = parseAnd(depth);
        if (!keywordIs(tok_, "OR")) return first;
        if (single_) lex_.fail(tok_.pos, "only one criterion is allowed");
        Filter::Node n;
        n.kind = NodeKind::Or;
        n.children.push_back(first);
        while (keywordIs(tok_, "OR")) {
            advance();
            n.children.push_back(parseAnd(depth));
        }
        return addNode(std::move(n));
    }

    uint32_t parseAnd(int depth) {
        uint32_t first = parsePrimary(depth);
        if (!keywordIs(tok_, "AND")) return first;
        if (single_) lex_.fail(tok_.pos, "only one criterion is allowed");
        Filter::Node n;
        n.kind = NodeKind::And;
        n.children.push_back(first);
        while (keywordIs(tok_, "AND")) {
            advance();
            n.children.push_back(parsePrimary(depth));
        }
        return addNode(std::move(n));
    }

    uint32_t parsePrimary(int depth) {
        if (tok_.kind == Tok::LParen) {
            if (depth >= kMaxDepth) lex_.fail(tok_.pos, "parentheses nested too deeply");
            advance();
            uint32_t inner = parseOr(depth + 1);
            if (tok_.kind != Tok::RParen) lex_.fail(tok_.pos, "')' expected");
            advance();
            return inner;
        }
        return parseComparison();
    }

    uint32_t parseComparison() {
        if (tok_.kind != Tok::Name || (!tok_.bracketed && isReserved(tok_)))
            lex_.fail(tok_.pos, tok_.kind == Tok::End ? "field name expected at the end"
                                                      : "field name expected");
        int field = t_.find(tok_.text);
        if (field < 0) lex_.fail(tok_.pos, "unknown field '" + tok_.text + "'");
        Filter::Node n;
        n.field = static_cast<uint32_t>(field);
        n.type = t_.defs[static_cast<size_t>(field)].type;
        advance();
        size_t opPos = tok_.pos;
        if (tok_.kind == Tok::Op) {
            n.op = tok_.op;
        } else if (keywordIs(tok_, "LIKE")) {
            n.op = Op::Like;
        } else if (keywordIs(tok_, "IS")) {
            advance();
            bool negate = false;
            if (keywordIs(tok_, "NOT")) negate = true, advance();
            if (!keywordIs(tok_, "NULL")) lex_.fail(tok_.pos, "NULL expected");
            advance();
            n.op = negate ? Op::NotNull : Op::IsNull;
            return addNode(std::move(n));
        } else {
            lex_.fail(tok_.pos, "comparison operator expected");
        }
        advance();
        bind(n, opPos);
        advance();
        return addNode(std::move(n));
    }

    static bool isReserved(const Token& t) {
        for (const char* kw : {"AND", "OR", "LIKE", "NULL", "IS", "NOT", "TRUE", "FALSE"})
            if (keywordIs(t, kw)) return true;
        return false;
    }

    [[noreturn]] void badValue(const std::string& what) const { lex_.fail(tok_.pos, what); }

    // Converts the value token to the field's domain.
    void bind(Filter::Node& n, size_t opPos) {
        const Token& v = tok_;
        if (keywordIs(v, "NULL")) {
            if (n.op == Op::Eq)
                n.op = Op::IsNull;
            else if (n.op == Op::Ne)
                n.op = Op::NotNull;
            else
                badValue("NULL can only be compared with = or <>");
            return;
        }
        bool isTrue = keywordIs(v, "TRUE"), isFalse = keywordIs(v, "FALSE");
        if (v.kind == Tok::Name && !isTrue && !isFalse) badValue("value expected");
        if (v.kind != Tok::Name && v.kind != Tok::String && v.kind != Tok::Date &&
            v.kind != Tok::Number && v.kind != Tok::GuidLit)
            badValue("value expected");
        if (n.op == Op::Like && n.type != FieldType::Text && n.type != FieldType::LongText)
            lex_.fail(opPos, "LIKE needs a text field");
        const std::string& fname = t_.defs[n.field].name;
        switch (n.type) {
            case FieldType::Boolean: {
                if (isTrue || isFalse) {
                    n.num = isTrue ? 1 : 0;
                } else if (v.kind == Tok::Number || v.kind == Tok::String) {
                    std::string f = foldCase(trim(v.text));
                    double d;
                    if (f == "true")
                        n.num = 1;
                    else if (f == "false")
                        n.num = 0;
                    else if (toDouble(f, d))
                        n.num = d != 0 ? 1 : 0;
                    else
                        badValue("not a Boolean value for field '" + fname + "'");
                } else {
                    badValue("not a Boolean value for field '" + fname + "'");
                }
                break;
            }
            case FieldType::Long:
            case FieldType::Double: {
                if (isTrue || isFalse)
                    n.num = isTrue ? -1 : 0;
                else if ((v.kind != Tok::Number && v.kind != Tok::String) ||
                         !toDouble(trim(v.text), n.num))
                    badValue("not a number for field '" + fname + "'");
                break;
            }
            case FieldType::Date: {
                if (v.kind == Tok::Date || v.kind == Tok::String) {
                    if (!parseDateLiteral(v.text, n.num))
                        badValue("not a date for field '" + fname + "'");
                } else if (v.kind == Tok::Number) {
                    if (!toDouble(v.text, n.num)) badValue("not a date for field '" + fname + "'");
                } else {
                    badValue("not a date for field '" + fname + "'");
                }
                break;
            }
            case FieldType::Currency:
            case FieldType::Decimal: {
                std::optional<Decimal> d;
                if (isTrue || isFalse)
                    d = Decimal(isTrue ? -1 : 0);
                else if (v.kind == Tok::Number || v.kind == Tok::String)
                    d = Decimal::parse(trim(v.text));
                if (!d) badValue("not a number for field '" + fname + "'");
                if (n.type == FieldType::Decimal) {
                    n.dec = *d;
                } else {
                    int sign = 0;
                    if (!parseScaled(d->toString(), n.cur, n.curInexact, sign))
                        n.curOverflow = sign;
                }
                break;
            }
            case FieldType::Guid: {
                auto g = (v.kind == Tok::GuidLit || v.kind == Tok::String)
                             ? Guid::parse(trim(v.text))
                             : std::nullopt;
                if (!g) badValue("not a GUID for field '" + fname + "'");
                n.guid = g->bytes;
                break;
            }
            case FieldType::Text:
            case FieldType::LongText: {
                TextMode mode = TextMode::Equal;
                std::string_view p = v.text;
                std::string literal;
                if (n.op == Op::Like) {
                    bool lead = false, trail = false;
                    literal = likeLiteral(p, lead, trail);
                    p = literal;
                    mode = lead && trail ? (p.empty() ? TextMode::Any : TextMode::Contains)
                           : lead        ? TextMode::Suffix
                           : trail       ? TextMode::Prefix
                                         : TextMode::Equal;
                    if (lead && !trail && p.empty()) mode = TextMode::Any;
                }
                n.text.init(p, mode);
                break;
            }
            case FieldType::Binary:
                lex_.fail(opPos, "binary fields cannot be compared");
        }
    }

    // The literal text of a LIKE pattern: wildcards ('*', '%') only at its
    // start and end; a character in brackets ("[*]", "[%]", "[[]") stands for
    // itself anywhere.
    std::string likeLiteral(std::string_view p, bool& lead, bool& trail) const {
        while (!p.empty() && (p.front() == '*' || p.front() == '%'))
            p.remove_prefix(1), lead = true;
        std::string out;
        size_t i = 0;
        while (i < p.size()) {
            const char c = p[i];
            if (c == '[') {
                size_t len = 1;  // one UTF-8 character after the bracket
                if (i + 1 < p.size()) {
                    const auto b = static_cast<uint8_t>(p[i + 1]);
                    len = b >= 0xF0 ? 4 : b >= 0xE0 ? 3 : b >= 0xC0 ? 2 : 1;
                }
                if (i + 1 + len < p.size() && p[i + 1 + len] == ']') {
                    out.append(p.substr(i + 1, len));
                    i += len + 2;
                    continue;
                }
            } else if (c == '*' || c == '%') {
                if (p.find_first_not_of("*%", i) != std::string_view::npos)
                    badValue("a LIKE pattern may have '*' or '%' only at its start and end");
                trail = true;
                break;
            }
            out.push_back(c);
            ++i;
        }
        return out;
    }

    static bool toDouble(std::string_view s, double& out) {
        if (!s.empty() && s.front() == '+') s.remove_prefix(1);
        if (s.empty()) return false;
        auto r = std::from_chars(s.data(), s.data() + s.size(), out);
        return r.ec == std::errc() && r.ptr == s.data() + s.size() && std::isfinite(out);
    }

    const Table& t_;
    std::string_view s_;
    Lexer lex_;
    bool single_;
    std::unique_ptr<Filter> f_;
    Token tok_;
};

std::shared_ptr<const Filter> Filter::compile(const Table& t, std::string_view text, bool single,
                                              const char* context) {
    return FilterParser(t, text, single, context).run();
}

bool Filter::matches(const Table& t, uint32_t row) const {
    struct Eval {
        const Filter& f;
        const Table& t;
        bool operator()(uint32_t idx, uint32_t row) const {
            const Node& n = f.nodes_[idx];
            switch (n.kind) {
                case NodeKind::Leaf:
                    return n.leafMatch(t.cols[n.field], row);
                case NodeKind::And:
                    for (uint32_t c : n.children)
                        if (!(*this)(c, row)) return false;
                    return true;
                case NodeKind::Or:
                    for (uint32_t c : n.children)
                        if ((*this)(c, row)) return true;
                    return false;
            }
            return false;
        }
    };
    return Eval{*this, t}(static_cast<uint32_t>(nodes_.size() - 1), row);
}

namespace {

template <class Pred>
void scan(std::span<const uint32_t> in, std::vector<uint32_t>& out, Pred pred) {
    for (uint32_t r : in)
        if (pred(r)) out.push_back(r);
}

void selectNode(const std::vector<Filter::Node>& nodes, uint32_t idx, const Table& t,
                std::span<const uint32_t> in, std::vector<uint32_t>& out) {
    const Filter::Node& n = nodes[idx];
    if (n.kind == NodeKind::And) {
        std::vector<uint32_t> a(in.begin(), in.end()), b;
        for (uint32_t c : n.children) {
            b.clear();
            selectNode(nodes, c, t, a, b);
            a.swap(b);
            if (a.empty()) break;
        }
        out.insert(out.end(), a.begin(), a.end());
        return;
    }
    if (n.kind == NodeKind::Or) {
        std::vector<uint64_t> hit((t.slots() + 63) / 64);
        std::vector<uint32_t> rest(in.begin(), in.end()), got, next;
        for (uint32_t c : n.children) {
            got.clear();
            selectNode(nodes, c, t, rest, got);
            if (got.empty()) continue;
            for (uint32_t r : got)
                hit[r >> 6] |= uint64_t{1} << (r & 63);
            next.clear();
            for (uint32_t r : rest)
                if (!((hit[r >> 6] >> (r & 63)) & 1)) next.push_back(r);
            rest.swap(next);
        }
        for (uint32_t r : in)
            if ((hit[r >> 6] >> (r & 63)) & 1) out.push_back(r);
        return;
    }
    const Column& col = t.cols[n.field];
    // Typed loops for the common leaves; the general path otherwise.
    if (n.op != Op::IsNull && n.op != Op::NotNull) {
        switch (n.type) {
            case FieldType::Boolean:
                if (n.op == Op::Eq || n.op == Op::Ne) {
                    const uint8_t want = (n.num != 0) == (n.op == Op::Eq) ? 1 : 0;
                    scan(in, out, [&](uint32_t r) {
                        return !col.isNull(r) && (col.b[r] != 0 ? 1 : 0) == want;
                    });
                    return;
                }
                break;
            case FieldType::Text:
            case FieldType::LongText:
                if (n.op == Op::Eq || n.op == Op::Like) {
                    scan(in, out,
                         [&](uint32_t r) { return !col.isNull(r) && n.text.match(col.text(r)); });
                    return;
                }
                break;
            default:
                break;
        }
    }
    scan(in, out, [&](uint32_t r) { return n.leafMatch(col, r); });
}

}  // namespace

void Filter::select(const Table& t, std::span<const uint32_t> in,
                    std::vector<uint32_t>& out) const {
    selectNode(nodes_, static_cast<uint32_t>(nodes_.size() - 1), t, in, out);
}

// ---------------------------------------------------------------------------

std::vector<SortKeySpec> parseSort(const Table& t, std::string_view text) {
    Lexer lex(text, "Sort");
    std::vector<SortKeySpec> keys;
    Token tok = lex.next();
    if (tok.kind == Tok::End) return keys;
    for (;;) {
        if (tok.kind != Tok::Name) lex.fail(tok.pos, "field name expected");
        int f = t.find(tok.text);
        if (f < 0) lex.fail(tok.pos, "unknown field '" + tok.text + "'");
        if (t.defs[static_cast<size_t>(f)].type == FieldType::Binary)
            lex.fail(tok.pos, "binary fields cannot be sorted");
        SortKeySpec k{static_cast<size_t>(f), false};
        tok = lex.next();
        if (keywordIs(tok, "ASC")) {
            tok = lex.next();
        } else if (keywordIs(tok, "DESC")) {
            k.descending = true;
            tok = lex.next();
        }
        keys.push_back(k);
        if (tok.kind == Tok::End) break;
        if (tok.kind != Tok::Comma) lex.fail(tok.pos, "',' expected");
        tok = lex.next();
    }
    return keys;
}

}  // namespace pelta::rsimpl
