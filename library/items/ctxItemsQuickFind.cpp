#include "library/items/ctxItemsQuickFind.h"

#include <algorithm>
#include <functional>

#include "library/frame/mdClassFactory.h"
#include "library/frame/mdGlobals.h"
#include "platform/data/collation.h"
#include "platform/data/recordset.h"

namespace PeltaNom15 {

namespace {

constexpr char kSep = '\x7F';

uint64_t HashOf(std::string_view FoldedText) {
    return std::hash<std::string_view>{}(FoldedText);
}

bool AllDigits(std::string_view s) {
    return !s.empty() &&
           std::all_of(s.begin(), s.end(), [](char c) { return c >= '0' && c <= '9'; });
}

bool StartsWith(std::string_view s, std::string_view p) {
    return s.size() >= p.size() && s.substr(0, p.size()) == p;
}

// The suite's options, read from the host application.
bool SearchByCodeFirst() {
    if (auto host = HostApplication()) return C2Bool(host->Option("SearchByCodeFirst"));
    return false;
}

// Match mode 1 matches at the start of the text; anything else anywhere.
bool MatchBeginsWith() {
    if (auto host = HostApplication()) return C2Lng(host->Option("MatchMode")) == 1;
    return false;
}

// The entries of a code list with their positions.
template <class F>
void ForEachEntry(std::string_view List, F&& Fn) {
    uint32_t index = 0;
    size_t start = 0;
    while (start < List.size()) {
        size_t sep = List.find(kSep, start);
        if (sep == std::string_view::npos) sep = List.size();
        if (sep > start) Fn(List.substr(start, sep - start), index++);
        start = sep + 1;
    }
}

std::string EntryAt(std::string_view List, uint32_t Wanted) {
    std::string out;
    ForEachEntry(List, [&](std::string_view e, uint32_t i) {
        if (i == Wanted) out = std::string(e);
    });
    return out;
}

std::string Braced(const std::string& Measure) {
    if (Measure.empty()) return {};
    if (Measure.front() == '{') return Measure;
    return "{" + Measure + "}";
}

}  // namespace

// ---- weight barcodes --------------------------------------------------------------------

std::string WeightPattern(std::string_view Template) {
    std::string out;
    for (char c : Template) {
        if (c == '.') continue;
        out.push_back(c == 'w' || c == 'l' || c == 'd' || c == 'c' ? '?' : c);
    }
    return out;
}

bool MatchesPattern(std::string_view Pattern, std::string_view Code) {
    if (Pattern.size() != Code.size()) return false;
    for (size_t i = 0; i < Pattern.size(); ++i)
        if (Pattern[i] != '?' && Pattern[i] != Code[i]) return false;
    return true;
}

cWeightCode DecodeWeightCode(std::string_view Template, std::string_view Code) {
    cWeightCode out;
    size_t k = 0;  // the code's digit
    for (size_t i = 0; i < Template.size() && k < Code.size(); ++i) {
        const char t = Template[i];
        if (t == '.') continue;
        const char digit = Code[k++];
        auto withPoint = [&](std::string& value) {
            value.push_back(digit);
            if (i + 1 < Template.size() && Template[i + 1] == '.') {
                ++i;
                if (value.find('.') == std::string::npos) value.push_back('.');
            }
        };
        if (t == 'w')
            withPoint(out.Weight);
        else if (t == 'l')
            out.Lot.push_back(digit);
        else if (t == 'd')
            withPoint(out.Third);
        // digits and 'c' are consumed and kept nowhere
    }
    return out;
}

std::string LikeClause(const std::string& Field, const std::string& Text, bool BeginsWith) {
    const bool codeList = Field == "BarCodes" || Field == "BarPrefixes" || Field == "SupplCodes";
    const bool anywhere = codeList || !BeginsWith;
    return "(" + Field + " LIKE '" + (anywhere ? "*" : "") + SqlQuote(Text) + "*')";
}

// ---- indexes ----------------------------------------------------------------------------

std::vector<uint32_t> cItemsQuickFind::Index::Rows(uint64_t Hash) const {
    std::vector<uint32_t> out;
    auto it = std::lower_bound(Entries.begin(), Entries.end(), Hash,
                               [](const Entry& e, uint64_t h) { return e.Hash < h; });
    for (; it != Entries.end() && it->Hash == Hash; ++it)
        out.push_back(it->Row);
    return out;
}

void cItemsQuickFind::Invalidate() {
    m_bBuilt = false;
    m_rsList.reset();
    m_rs.reset();
    m_oCodes = {};
    m_oBarCodes = {};
    m_oPrefixes = {};
    m_oSupplCodes = {};
}

void cItemsQuickFind::pvBuild(const RecordsetRef& List) {
    if (m_bBuilt && m_rsList == List) return;
    Invalidate();
    m_rsList = List;
    m_rs = List->clone();
    m_lID = m_rs->fieldIndex("ID");
    m_lCode = m_rs->fieldIndex("Code");
    m_lBarCodes = m_rs->fieldIndex("BarCodes");
    m_lBarPrefixes = m_rs->fieldIndex("BarPrefixes");
    m_lBarMeasures = m_rs->fieldIndex("BarMeasures");
    m_lSupplCodes = m_rs->fieldIndex("SupplCodes");
    m_lSupplMeasures = m_rs->fieldIndex("SupplMeasures");

    auto walker = List->clone();
    const int64_t n = walker->recordCount();
    m_oCodes.Entries.reserve(static_cast<size_t>(n));
    m_oBarCodes.Entries.reserve(static_cast<size_t>(n) * 2);
    std::string folded;
    auto add = [&](Index& ix, std::string_view text, uint32_t row, uint32_t index) {
        folded.clear();
        pelta::foldCaseAppend(text, folded);
        ix.Entries.push_back(Entry{HashOf(folded), row, index});
    };
    if (n > 0) {
        for (walker->moveFirst(); !walker->eof(); walker->moveNext()) {
            const uint32_t row = static_cast<uint32_t>(walker->bookmark().toDouble()) - 1;
            auto text = [&](int field) -> std::string {
                if (field < 0) return {};
                auto v = walker->value(static_cast<size_t>(field));
                return v.isString() ? v.str() : std::string();
            };
            if (m_lCode >= 0) add(m_oCodes, text(m_lCode), row, 0);
            ForEachEntry(text(m_lBarCodes),
                         [&](std::string_view e, uint32_t i) { add(m_oBarCodes, e, row, i); });
            ForEachEntry(text(m_lBarPrefixes),
                         [&](std::string_view e, uint32_t i) { add(m_oPrefixes, e, row, i); });
            ForEachEntry(text(m_lSupplCodes),
                         [&](std::string_view e, uint32_t i) { add(m_oSupplCodes, e, row, i); });
        }
    }
    for (Index* ix : {&m_oCodes, &m_oBarCodes, &m_oPrefixes, &m_oSupplCodes})
        std::sort(ix->Entries.begin(), ix->Entries.end(),
                  [](const Entry& a, const Entry& b) { return a.Hash < b.Hash; });
    m_bBuilt = true;
}

std::string cItemsQuickFind::pvText(uint32_t Row, int Field) {
    if (Field < 0) return {};
    m_rs->setBookmark(pelta::Variant(static_cast<double>(Row) + 1.0));
    auto v = m_rs->value(static_cast<size_t>(Field));
    return v.isString() ? v.str() : std::string();
}

std::vector<std::pair<uint32_t, uint32_t>> cItemsQuickFind::pvWhole(const Index& Ix,
                                                                    const char* Field,
                                                                    const std::string& Value) {
    std::vector<std::pair<uint32_t, uint32_t>> out;
    const std::string wanted = pelta::foldCase(Value);
    auto it = std::lower_bound(Ix.Entries.begin(), Ix.Entries.end(), HashOf(wanted),
                               [](const Entry& e, uint64_t h) { return e.Hash < h; });
    const int field = m_rs->fieldIndex(Field);
    for (; it != Ix.Entries.end() && it->Hash == HashOf(wanted); ++it) {
        // The hash only narrows the search: the entry itself must be equal.
        const std::string entry = EntryAt(pvText(it->Row, field), it->Index);
        if (pelta::equalsIgnoreCase(entry, Value) &&
            std::none_of(out.begin(), out.end(), [&](const auto& p) { return p.first == it->Row; }))
            out.emplace_back(it->Row, it->Index);
    }
    return out;
}

std::vector<uint32_t> cItemsQuickFind::pvFilter(const std::string& Clause, size_t Limit) {
    std::vector<uint32_t> out;
    auto rs = m_rsList->clone();
    rs->setFilter(Clause);
    if (rs->recordCount() == 0) return out;
    for (rs->moveFirst(); !rs->eof() && out.size() < Limit; rs->moveNext())
        out.push_back(static_cast<uint32_t>(rs->bookmark().toDouble()) - 1);
    return out;
}

bool cItemsQuickFind::pvOne(const std::vector<uint32_t>& Rows, pelta::Variant& Found) {
    if (Rows.size() != 1) return false;
    Found = pelta::Variant(static_cast<double>(Rows.front()) + 1.0);
    return true;
}

bool cItemsQuickFind::pvExactCode(const std::string& Value, pelta::Variant& Found) {
    std::vector<uint32_t> rows;
    const std::string folded = pelta::foldCase(Value);
    for (uint32_t row : m_oCodes.Rows(HashOf(folded)))
        if (pelta::equalsIgnoreCase(pvText(row, m_lCode), Value)) rows.push_back(row);
    return pvOne(rows, Found);
}

// A whole entry of the code list first; else the entries that contain the
// value. The measure of the entry found goes with the item.
bool cItemsQuickFind::pvCodeList(const char* Field, const char* Measures, const Index& Ix,
                                 const std::string& Value, pelta::Variant& Found,
                                 cQuickFindState& State, CodeMatch Match) {
    auto whole = pvWhole(Ix, Field, Value);
    uint32_t row = 0, entry = 0;
    if (whole.size() == 1 && Match != CodeMatch::Inside) {
        row = whole.front().first;
        entry = whole.front().second;
    } else if (whole.size() == 1 || (whole.empty() && Match == CodeMatch::Whole)) {
        return false;
    } else if (whole.empty()) {
        auto rows = pvFilter(LikeClause(Field, Value, false));
        if (rows.size() != 1) return false;
        row = rows.front();
        const std::string wanted = pelta::foldCase(Value);
        bool seen = false;
        ForEachEntry(pvText(row, m_rs->fieldIndex(Field)), [&](std::string_view e, uint32_t i) {
            if (!seen && pelta::foldCase(e).find(wanted) != std::string::npos) {
                seen = true;
                entry = i;
            }
        });
    } else {
        return false;  // several items carry the code
    }
    Found = pelta::Variant(static_cast<double>(row) + 1.0);
    State.Measure = Braced(EntryAt(pvText(row, m_rs->fieldIndex(Measures)), entry));
    return true;
}

bool cItemsQuickFind::pvWeight(const std::string& Digits, pelta::Variant& Found,
                               cQuickFindState& State) {
    for (size_t len = Digits.size(); len >= 1; --len) {
        const std::string prefix = Digits.substr(0, len);
        std::vector<uint32_t> rows;
        for (uint32_t row : m_oPrefixes.Rows(HashOf(prefix)))
            if (std::find(rows.begin(), rows.end(), row) == rows.end()) rows.push_back(row);
        std::sort(rows.begin(), rows.end());
        for (uint32_t row : rows) {
            bool hit = false;
            uint32_t which = 0;
            std::string templ;
            ForEachEntry(pvText(row, m_lBarCodes), [&](std::string_view e, uint32_t i) {
                if (!hit && MatchesPattern(WeightPattern(e), Digits)) {
                    hit = true;
                    which = i;
                    templ = std::string(e);
                }
            });
            if (!hit) continue;
            const cWeightCode decoded = DecodeWeightCode(templ, Digits);
            Found = pelta::Variant(static_cast<double>(row) + 1.0);
            if (auto q = pelta::Decimal::parse(decoded.Weight); q && !decoded.Weight.empty())
                State.Quantity = *q;
            State.Lot = decoded.Lot;
            State.Third = decoded.Third;
            State.Measure = Braced(EntryAt(pvText(row, m_lBarMeasures), which));
            return true;
        }
    }
    return false;
}

bool cItemsQuickFind::Find(const RecordsetRef& List, const std::string& Text, pelta::Variant& Found,
                           cQuickFindState& State) {
    State = {};
    Found = {};
    if (!List || Text.empty()) return false;
    pvBuild(List);
    bool ok = false;
    if (IsGuid(Text)) {
        ok = pvOne(pvFilter("ID = '" + SqlQuote(Text) + "'", 1), Found);
    } else if (StartsWith(Text, "///")) {
        if (Text.size() < 4) return false;
        ok = pvCodeList("SupplCodes", "SupplMeasures", m_oSupplCodes, Text.substr(3), Found, State);
    } else if (StartsWith(Text, "//")) {
        if (Text.size() < 3) return false;
        // A whole barcode; a scale label that fits a weight template; a
        // barcode that contains the value (the one search that reads every
        // row comes last).
        const std::string value = Text.substr(2);
        const bool whole = !pvWhole(m_oBarCodes, "BarCodes", value).empty();
        ok = pvCodeList("BarCodes", "BarMeasures", m_oBarCodes, value, Found, State,
                        CodeMatch::Whole);
        if (!ok && !whole && AllDigits(value)) ok = pvWeight(value, Found, State);
        if (!ok && !whole) {
            State = {};
            ok = pvCodeList("BarCodes", "BarMeasures", m_oBarCodes, value, Found, State,
                            CodeMatch::Inside);
        }
        if (!ok && whole && AllDigits(value)) {
            // Several items share the barcode: a weight template may still fit.
            State = {};
            ok = pvWeight(value, Found, State);
        }
    } else if (StartsWith(Text, "/")) {
        if (Text.size() <= 1) return false;
        const std::string value = Text.substr(1);
        ok = pvExactCode(value, Found) ||
             pvOne(pvFilter(LikeClause("Code", value, MatchBeginsWith())), Found);
    } else if (!SearchByCodeFirst()) {
        ok = pvOne(pvFilter("Name = '" + SqlQuote(Text) + "'"), Found) ||
             pvOne(pvFilter(LikeClause("Name", Text, MatchBeginsWith())), Found);
    } else {
        const bool begins = MatchBeginsWith();
        ok = pvExactCode(Text, Found) || pvOne(pvFilter("Name = '" + SqlQuote(Text) + "'"), Found);
        if (!ok) ok = pvCodeList("BarCodes", "BarMeasures", m_oBarCodes, Text, Found, State);
        if (!ok) {
            State = {};
            ok = pvCodeList("SupplCodes", "SupplMeasures", m_oSupplCodes, Text, Found, State);
        }
        if (!ok && AllDigits(Text)) {
            State = {};
            ok = pvWeight(Text, Found, State);
        }
        if (!ok) {
            State = {};
            ok = pvOne(pvFilter(LikeClause("Code", Text, begins)), Found) ||
                 pvOne(pvFilter(LikeClause("Name", Text, begins)), Found);
        }
    }
    if (!ok) {
        State = {};
        Found = {};
        return false;
    }
    if (m_lID >= 0) State.ItemID = pvText(static_cast<uint32_t>(Found.toDouble()) - 1, m_lID);
    return true;
}

}  // namespace PeltaNom15
