// Sorting of recordset rows: stable, by one or more fields, text by the
// Bulgarian collation through precomputed sort keys.
#include <algorithm>
#include <cmath>
#include <cstring>

#include "platform/data/collation.h"
#include "platform/data/filter.h"
#include "platform/data/recordset_impl.h"

namespace pelta::rsimpl {

namespace {

struct Key {
    const Column* col;
    bool desc;
    std::string keys;               // text: concatenated collation keys
    std::vector<uint32_t> offsets;  // text: by position in the input, size n + 1
};

inline int cmpDouble(double a, double b) {
    const bool na = std::isnan(a), nb = std::isnan(b);
    if (na || nb) return na == nb ? 0 : na ? 1 : -1;
    return a < b ? -1 : a > b ? 1 : 0;
}

inline int cmpBytes(std::string_view a, std::string_view b) {
    size_t n = std::min(a.size(), b.size());
    int c = n ? std::memcmp(a.data(), b.data(), n) : 0;
    if (c) return c < 0 ? -1 : 1;
    return a.size() < b.size() ? -1 : a.size() > b.size() ? 1 : 0;
}

inline uint64_t prefixOf(std::string_view k) {
    uint64_t p = 0;
    for (size_t i = 0; i < 8; ++i)
        p = (p << 8) | (i < k.size() ? static_cast<uint8_t>(k[i]) : 0);
    return p;
}

}  // namespace

std::vector<uint32_t> sortRows(const Table& t, std::vector<uint32_t> rows,
                               const std::vector<SortKeySpec>& specs) {
    const size_t n = rows.size();
    std::vector<Key> keys;
    keys.reserve(specs.size());
    SortKeyMaker maker("bg");
    for (const SortKeySpec& s : specs) {
        Key k{&t.cols[s.field], s.descending, {}, {}};
        if (k.col->type == FieldType::Text || k.col->type == FieldType::LongText) {
            k.offsets.reserve(n + 1);
            k.keys.reserve(n * 24);
            for (uint32_t r : rows) {
                k.offsets.push_back(static_cast<uint32_t>(k.keys.size()));
                if (!k.col->isNull(r)) maker.append(k.col->text(r), k.keys);
                if (k.keys.size() > UINT32_MAX)
                    raiseRs(rserr::IllegalOperation, "Sort keys too large");
            }
            k.offsets.push_back(static_cast<uint32_t>(k.keys.size()));
        }
        keys.push_back(std::move(k));
    }
    auto textKey = [](const Key& k, uint32_t i) {
        return std::string_view(k.keys.data() + k.offsets[i], k.offsets[i + 1] - k.offsets[i]);
    };
    // Compares input positions i and j by one key (nulls first).
    auto cmpKey = [&](const Key& k, uint32_t i, uint32_t j) -> int {
        const Column& c = *k.col;
        const uint32_t a = rows[i], b = rows[j];
        const bool na = c.isNull(a), nb = c.isNull(b);
        if (na || nb) return na == nb ? 0 : na ? -1 : 1;
        switch (c.type) {
            case FieldType::Boolean:
                return int(c.b[a] != 0) - int(c.b[b] != 0);
            case FieldType::Long:
                return c.i32[a] < c.i32[b] ? -1 : c.i32[a] > c.i32[b] ? 1 : 0;
            case FieldType::Double:
            case FieldType::Date:
                return cmpDouble(c.f64[a], c.f64[b]);
            case FieldType::Currency:
                return c.i64[a] < c.i64[b] ? -1 : c.i64[a] > c.i64[b] ? 1 : 0;
            case FieldType::Decimal: {
                auto o = c.dec[a] <=> c.dec[b];
                return o < 0 ? -1 : o > 0 ? 1 : 0;
            }
            case FieldType::Guid: {
                int r = std::memcmp(c.guid[a].data(), c.guid[b].data(), 16);
                return r < 0 ? -1 : r > 0 ? 1 : 0;
            }
            case FieldType::Text:
            case FieldType::LongText:
                return cmpBytes(textKey(k, i), textKey(k, j));
            case FieldType::Binary:
                return cmpBytes(c.text(a), c.text(b));
        }
        return 0;
    };

    struct Entry {
        uint64_t prefix;
        uint32_t pos;
        uint32_t nullFirst;  // 0 for Null in the first key, 1 otherwise
    };
    std::vector<Entry> entries(n);
    const Key& k0 = keys.front();
    const bool textFirst = !k0.offsets.empty();
    for (uint32_t i = 0; i < n; ++i) {
        entries[i].pos = i;
        entries[i].nullFirst = k0.col->isNull(rows[i]) ? 0 : 1;
        entries[i].prefix = textFirst ? prefixOf(textKey(k0, i)) : 0;
    }
    std::sort(entries.begin(), entries.end(), [&](const Entry& x, const Entry& y) {
        if (textFirst) {
            if (x.nullFirst != y.nullFirst)
                return k0.desc ? x.nullFirst > y.nullFirst : x.nullFirst < y.nullFirst;
            if (x.prefix != y.prefix) return k0.desc ? x.prefix > y.prefix : x.prefix < y.prefix;
        }
        for (const Key& k : keys) {
            int c = cmpKey(k, x.pos, y.pos);
            if (c) return k.desc ? c > 0 : c < 0;
        }
        return x.pos < y.pos;  // stable
    });
    std::vector<uint32_t> out(n);
    for (size_t i = 0; i < n; ++i)
        out[i] = rows[entries[i].pos];
    return out;
}

}  // namespace pelta::rsimpl
