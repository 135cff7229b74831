// Text comparison helpers for recordsets: case folding for comparisons that
// ignore case, and collation sort keys for sorting text.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace pelta {

// Appends the simple case folding of UTF-8 `in` to `out`: each character is
// replaced by its case-folded form (one character for one). ASCII and
// Cyrillic are folded inline; other characters through ICU. Malformed bytes
// are copied unchanged.
void foldCaseAppend(std::string_view in, std::string& out);
std::string foldCase(std::string_view in);

// Whether two texts are equal without regard to case.
bool equalsIgnoreCase(std::string_view a, std::string_view b);

// Builds binary sort keys of a collation: comparing keys with memcmp orders
// texts as the collation does. One instance per thread.
class SortKeyMaker {
public:
    // `locale` such as "bg"; falls back to the root collation when unknown.
    explicit SortKeyMaker(const char* locale = "bg");
    ~SortKeyMaker();
    SortKeyMaker(const SortKeyMaker&) = delete;
    SortKeyMaker& operator=(const SortKeyMaker&) = delete;

    // Appends the key of `text` (without a terminating zero) to `out`.
    void append(std::string_view text, std::string& out);

private:
    struct Impl;
    std::unique_ptr<Impl> impl_;
};

}  // namespace pelta
