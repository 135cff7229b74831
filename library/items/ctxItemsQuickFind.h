// The quick find of the items list: a GUID, "/" code, "//" barcode (weight
// barcodes included), "///" supplier code, or text without a prefix in the
// order the suite's code-first option sets. Whole codes are looked up in
// indexes built once per list from the rows' code lists; substrings and
// names through filters on a clone of the list.
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "library/contracts/Extenders.h"
#include "library/items/ctxItemsPrices.h"

namespace PeltaNom15 {

// A weight-barcode template read against scanned digits.
struct cWeightCode {
    std::string Weight;  // "01.234"
    std::string Lot;
    std::string Third;
};
// The template ("21ww.wwwc") as a match pattern ("21??????").
std::string WeightPattern(std::string_view Template);
// Whether `Code` fits the pattern ('?' any character).
bool MatchesPattern(std::string_view Pattern, std::string_view Code);
// Walks the template and the code together.
cWeightCode DecodeWeightCode(std::string_view Template, std::string_view Code);

// A filter clause "(Field LIKE '...')" for typed text: match anywhere, or at
// the start when `BeginsWith`; the code lists always match anywhere. The
// text is quoted.
std::string LikeClause(const std::string& Field, const std::string& Text, bool BeginsWith);

class cItemsQuickFind {
public:
    // Searches the list `List` (the rows, unfiltered). True when exactly one
    // item was identified; `Found` is then its bookmark and `State` what the
    // code that found it carries. The state is cleared first.
    bool Find(const RecordsetRef& List, const std::string& Text, pelta::Variant& Found,
              cQuickFindState& State);
    // The list changed: the indexes are built again when next needed.
    void Invalidate();

private:
    struct Entry {
        uint64_t Hash;
        uint32_t Row;    // bookmark - 1
        uint32_t Index;  // entry of the code list
    };
    struct Index {
        std::vector<Entry> Entries;  // ordered by hash
        std::vector<uint32_t> Rows(uint64_t Hash) const;
    };
    void pvBuild(const RecordsetRef& List);
    // Rows whose list `Field` holds `Value` as a whole entry (without regard
    // to case), with the entry's position.
    std::vector<std::pair<uint32_t, uint32_t>> pvWhole(const Index& Ix, const char* Field,
                                                       const std::string& Value);
    // Rows matching a filter clause, at most `Limit` of them.
    std::vector<uint32_t> pvFilter(const std::string& Clause, size_t Limit = 2);
    // Whole entries first, then (Any) entries that contain the value; or
    // only one of the two.
    enum class CodeMatch { Any, Whole, Inside };
    bool pvCodeList(const char* Field, const char* Measures, const Index& Ix,
                    const std::string& Value, pelta::Variant& Found, cQuickFindState& State,
                    CodeMatch Match = CodeMatch::Any);
    bool pvWeight(const std::string& Digits, pelta::Variant& Found, cQuickFindState& State);
    bool pvExactCode(const std::string& Value, pelta::Variant& Found);
    bool pvOne(const std::vector<uint32_t>& Rows, pelta::Variant& Found);
    std::string pvText(uint32_t Row, int Field);

    RecordsetRef m_rsList;  // the list the indexes were built for
    RecordsetRef m_rs;      // a clone that reads rows by bookmark
    bool m_bBuilt = false;
    int m_lCode = -1, m_lBarCodes = -1, m_lBarPrefixes = -1, m_lBarMeasures = -1;
    int m_lSupplCodes = -1, m_lSupplMeasures = -1, m_lID = -1;
    Index m_oCodes, m_oBarCodes, m_oPrefixes, m_oSupplCodes;
};

}  // namespace PeltaNom15
