#include "bll/columnar.h"

#include <algorithm>
#include <cctype>
#include <cstring>

#include "platform/automation/error.h"
#include "platform/automation/guid.h"

namespace pelta::bll {

namespace {

constexpr char kMagic[4] = {'P', 'L', 'R', 'S'};
constexpr uint32_t kVersion = 1;

bool sameName(std::string_view a, std::string_view b) noexcept {
    if (a.size() != b.size()) return false;
    for (size_t i = 0; i < a.size(); ++i)
        if (std::tolower(static_cast<unsigned char>(a[i])) !=
            std::tolower(static_cast<unsigned char>(b[i])))
            return false;
    return true;
}

}  // namespace

struct ColumnarRows::Column {
    FieldDef def;
    ColumnType type;
    std::vector<uint64_t> nulls;
    std::vector<uint8_t> fixed;   // fixed-size values, packed
    std::string arena;            // texts
    std::vector<uint32_t> spans;  // offset, length per row

    size_t width() const {
        switch (def.type) {
            case FieldType::Boolean:
                return 1;
            case FieldType::Long:
                return 4;
            case FieldType::Double:
            case FieldType::Date:
            case FieldType::Currency:
                return 8;
            case FieldType::Decimal:
            case FieldType::Guid:
                return 16;
            default:
                return 0;
        }
    }

    void append(const Statement& st, int c, size_t row) {
        if ((row >> 6) >= nulls.size()) nulls.push_back(0);
        const size_t w = width();
        const bool isNull = st.isNull(c);
        if (isNull) nulls[row >> 6] |= uint64_t{1} << (row & 63);
        if (w == 0) {
            std::string_view t = isNull ? std::string_view() : st.text(c);
            spans.push_back(static_cast<uint32_t>(arena.size()));
            spans.push_back(static_cast<uint32_t>(t.size()));
            arena.append(t);
            return;
        }
        const size_t at = fixed.size();
        fixed.resize(at + w);
        if (isNull) return;
        uint8_t* p = fixed.data() + at;
        switch (def.type) {
            case FieldType::Boolean:
                *p = st.int64(c) != 0;
                break;
            case FieldType::Long: {
                const int32_t v = static_cast<int32_t>(st.int64(c));
                std::memcpy(p, &v, 4);
                break;
            }
            case FieldType::Double: {
                const double v = st.real(c);
                std::memcpy(p, &v, 8);
                break;
            }
            case FieldType::Date: {
                const double v = st.value(c, type).toDate().oa;
                std::memcpy(p, &v, 8);
                break;
            }
            case FieldType::Currency: {
                const int64_t v = st.value(c, type).toCurrency().scaled;
                std::memcpy(p, &v, 8);
                break;
            }
            case FieldType::Decimal: {
                // Kept as an integer scaled by 10^scale.
                const Decimal d = st.value(c, type).toDecimal();
                const uint64_t lo = d.lo();
                const uint32_t hi = d.hi();
                std::memcpy(p, &lo, 8);
                std::memcpy(p + 8, &hi, 4);
                p[12] = static_cast<uint8_t>(d.scale());
                p[13] = d.negative() ? 1 : 0;
                break;
            }
            case FieldType::Guid: {
                auto g = Guid::parse(st.text(c));
                if (!g)
                    raise(errc::InvalidData,
                          "The column " + def.name + " holds a key that is not a GUID", "Database");
                std::memcpy(p, g->bytes.data(), 16);
                break;
            }
            default:
                break;
        }
    }
};

ColumnarRows::ColumnarRows() : columns_(new std::vector<Column>()) {}
ColumnarRows::~ColumnarRows() {
    delete columns_;
}

size_t ColumnarRows::rowCount() const noexcept {
    return rows_;
}

Ref<ColumnarRows> ColumnarRows::read(Database& db, std::string_view sql,
                                     std::span<const Variant> params,
                                     std::span<const FieldDef> fields) {
    auto st = db.prepare(sql);
    for (size_t i = 0; i < params.size(); ++i)
        st->bind(static_cast<int>(i + 1), params[i]);
    auto out = makeRef<ColumnarRows>();
    auto& cols = *out->columns_;
    const int n = st->columnCount();
    bool hasRow = st->step();
    for (int c = 0; c < n; ++c) {
        Column col;
        std::string name = st->columnName(c);
        auto given = std::find_if(fields.begin(), fields.end(),
                                  [&](const FieldDef& f) { return sameName(f.name, name); });
        if (given != fields.end()) {
            col.def = *given;
            col.def.name = name;
            col.type.field = given->type;
            col.type.size = given->definedSize;
            col.type.precision = given->precision;
            col.type.scale = given->scale;
        } else if (auto t = ColumnType::parse(st->columnDeclType(c))) {
            col.type = *t;
            col.def = t->fieldDef(name);
        } else {
            // An expression of no declared type: text.
            col.def.name = name;
            col.def.type = FieldType::Text;
            col.type.field = FieldType::Text;
        }
        if (col.def.type == FieldType::Decimal && col.def.precision == 0)
            col.def.precision = Decimal::kMaxScale;
        cols.push_back(std::move(col));
    }
    size_t row = 0;
    while (hasRow) {
        for (int c = 0; c < n; ++c)
            cols[static_cast<size_t>(c)].append(*st, c, row);
        ++row;
        hasRow = st->step();
    }
    out->rows_ = row;
    return out;
}

void ColumnarRows::persist(ByteWriter& w) const {
    if (written_)
        raise(errc::InvalidProcedureCall, "The rows were written already", "ColumnarRows");
    written_ = true;
    auto& cols = *columns_;
    const size_t n = rows_;
    w.raw(kMagic, 4);
    w.u32(kVersion);
    w.varint(cols.size());
    for (const Column& c : cols) {
        w.str(c.def.name);
        w.u8(static_cast<uint8_t>(c.def.type));
        w.u32(c.def.definedSize);
        w.u8(c.def.precision);
        w.u8(c.def.scale);
        w.u8(c.def.nullable ? 1 : 0);
    }
    w.varint(n);
    {
        const std::vector<uint8_t> unmodified(n, 0);
        w.raw(unmodified.data(), n);
    }
    const size_t words = (n + 63) / 64;
    for (Column& c : cols) {
        c.nulls.resize(words);
        w.raw(c.nulls.data(), words * 8);
        if (c.width() > 0) {
            w.raw(c.fixed.data(), c.fixed.size());
        } else {
            w.varint(c.arena.size());
            w.raw(c.arena.data(), c.arena.size());
            w.raw(c.spans.data(), c.spans.size() * sizeof(uint32_t));
        }
        // Written once: what is written need not be kept.
        c = Column{c.def, c.type, {}, {}, {}, {}};
    }
    w.varint(0);  // no original values
}

}  // namespace pelta::bll
