// Criteria of recordset filters and finds in the ADO grammar, compiled against
// a table's fields into a tree that evaluates over typed columns.
//
//   criteria   := or-expr
//   or-expr    := and-expr { OR and-expr }
//   and-expr   := primary { AND primary }
//   primary    := '(' or-expr ')' | field op value | field IS [NOT] NULL
//   field      := name | '[' any text but ']' ']'
//   op         := '=' | '<>' | '<' | '>' | '<=' | '>=' | LIKE
//   value      := 'text' (a quote inside doubled) | #date# | number | {GUID}
//               | TRUE | FALSE | NULL
//
// `field = NULL` and `field <> NULL` test for Null. LIKE takes '*' or '%' at
// the start and/or end of the pattern only; a character in brackets stands
// for itself ("[*]", "[%]", "[[]"), so that any typed text can be searched. Text compares without
// regard to case. Errors raise rserr::InvalidArgument naming the 1-based character position.
#pragma once

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "platform/data/recordset_impl.h"

namespace pelta::rsimpl {

class Filter {
public:
    // `single`: one comparison only (Find). `context` names the caller in errors.
    static std::shared_ptr<const Filter> compile(const Table& t, std::string_view text, bool single,
                                                 const char* context);
    ~Filter();

    bool matches(const Table& t, uint32_t row) const;
    // Appends to `out` the rows of `in` that match, in the order of `in`.
    void select(const Table& t, std::span<const uint32_t> in, std::vector<uint32_t>& out) const;

    struct Node;

private:
    Filter();
    std::vector<Node> nodes_;
    friend class FilterParser;
};

struct SortKeySpec {
    size_t field;
    bool descending;
};
// Parses "Name ASC, [Code] DESC"; raises InvalidArgument with the position.
std::vector<SortKeySpec> parseSort(const Table& t, std::string_view text);

// Parses a date literal: yyyy-mm-dd, m/d/yyyy or d.m.yyyy, each with an
// optional time hh:nn[:ss] (and AM/PM after m/d/yyyy); else as CDate does.
bool parseDateLiteral(std::string_view text, double& oa);

}  // namespace pelta::rsimpl
