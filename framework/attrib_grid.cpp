#include "framework/attrib_grid.h"

#include <algorithm>

#include "framework/services.h"
#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/automation/guid.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using namespace PeltaNom15;

namespace {

std::string text(const pelta::Variant& v) {
    if (v.isEmpty() || v.isNull()) return {};
    try {
        return v.toString();
    } catch (const pelta::Error&) {
        return {};
    }
}

std::vector<std::string> splitBars(const std::string& s) {
    std::vector<std::string> out;
    if (s.empty()) return out;
    size_t start = 0;
    while (true) {
        size_t bar = s.find('|', start);
        out.push_back(s.substr(start, bar == std::string::npos ? std::string::npos : bar - start));
        if (bar == std::string::npos) break;
        start = bar + 1;
    }
    return out;
}

bool wholeNumber(const std::string& s, int32_t& out) {
    if (s.empty() || s.size() > 9) return false;
    size_t i = s[0] == '-' ? 1 : 0;
    if (i == s.size()) return false;
    int32_t v = 0;
    for (; i < s.size(); ++i) {
        if (s[i] < '0' || s[i] > '9') return false;
        v = v * 10 + (s[i] - '0');
    }
    out = s[0] == '-' ? -v : v;
    return true;
}

// Text that is empty or only spaces clears a value.
bool blank(const pelta::Variant& v) {
    if (v.isEmpty() || v.isNull()) return true;
    if (!v.isString()) return false;
    return std::all_of(v.str().begin(), v.str().end(),
                       [](char c) { return c == ' ' || c == '\t' || c == '\r' || c == '\n'; });
}

bool isNumberField(pelta::FieldType t) {
    return t == pelta::FieldType::Long || t == pelta::FieldType::Double ||
           t == pelta::FieldType::Currency || t == pelta::FieldType::Decimal;
}

// Equal as a list compares keys: numbers numerically, texts without case.
bool sameKey(const pelta::Variant& a, const pelta::Variant& b) {
    if (a.isNull() || b.isNull() || a.isEmpty() || b.isEmpty()) return false;
    try {
        return pelta::compareValues(a, b, true) == 0;
    } catch (const pelta::Error&) {
        return false;
    }
}

std::string withThousands(const std::string& digits) {
    std::string out;
    size_t lead = digits.size() % 3;
    for (size_t i = 0; i < digits.size(); ++i) {
        if (i > 0 && i >= lead && (i - lead) % 3 == 0) out += ',';
        out += digits[i];
    }
    return out;
}

}  // namespace

// ---- numbers ------------------------------------------------------------------------

std::string formatNumber(const pelta::Variant& value, std::string_view format) {
    if (!value.isNumber() || value.type() == pelta::VarType::Boolean) return text(value);
    std::string pattern(format);
    if (pattern.empty() || equalsNoCaseAscii(pattern, "General Number")) return text(value);
    if (equalsNoCaseAscii(pattern, "Fixed"))
        pattern = "0.00";
    else if (equalsNoCaseAscii(pattern, "Standard"))
        pattern = "#,##0.00";
    else if (equalsNoCaseAscii(pattern, "Percent"))
        pattern = "0.00%";
    pattern = pattern.substr(0, pattern.find(';'));

    const size_t first = pattern.find_first_of("#0.,");
    const size_t last = pattern.find_last_of("#0.,");
    if (first == std::string::npos) return text(value);
    const std::string prefix = pattern.substr(0, first);
    const std::string core = pattern.substr(first, last - first + 1);
    const std::string suffix = pattern.substr(last + 1);
    if (core.find_first_not_of("#0.,") != std::string::npos) return text(value);

    const size_t point = core.find('.');
    const std::string intPart = core.substr(0, point);
    const std::string fracPart = point == std::string::npos ? std::string() : core.substr(point);
    const bool thousands = intPart.find(',') != std::string::npos;
    const auto minInt = std::count(intPart.begin(), intPart.end(), '0');
    const auto minFrac = std::count(fracPart.begin(), fracPart.end(), '0');
    const auto maxFrac = std::min<std::ptrdiff_t>(
        minFrac + std::count(fracPart.begin(), fracPart.end(), '#'), pelta::Decimal::kMaxScale);

    pelta::Decimal d;
    try {
        d = value.type() == pelta::VarType::Double ? pelta::Decimal::fromDouble(value.rawDouble())
                                                   : value.toDecimal();
        if ((prefix + suffix).find('%') != std::string::npos) d = d * pelta::Decimal(100);
        d = d.round(static_cast<int>(maxFrac));
    } catch (const pelta::Error&) {
        return text(value);
    }
    std::string digits = d.abs().toString();
    size_t dot = digits.find('.');
    std::string whole = digits.substr(0, dot);
    std::string frac = dot == std::string::npos ? std::string() : digits.substr(dot + 1);
    while (!frac.empty() && frac.back() == '0' &&
           static_cast<std::ptrdiff_t>(frac.size()) > minFrac)
        frac.pop_back();
    while (static_cast<std::ptrdiff_t>(frac.size()) < minFrac)
        frac += '0';
    if (whole == "0" && minInt == 0) whole.clear();
    while (static_cast<std::ptrdiff_t>(whole.size()) < minInt)
        whole.insert(whole.begin(), '0');
    if (thousands) whole = withThousands(whole);

    std::string out = d.negative() && !d.isZero() ? "-" : "";
    out += prefix + whole;
    if (!frac.empty()) out += "." + frac;
    return out + suffix;
}

std::optional<pelta::Decimal> parseTypedNumber(std::string_view typed) {
    std::string s;
    for (size_t i = 0; i < typed.size(); ++i) {
        char c = typed[i];
        if (c == ' ' || c == '\t') continue;
        // A no-break space (U+00A0, U+202F) separating thousands.
        if (c == '\xC2' && i + 1 < typed.size() && typed[i + 1] == '\xA0') {
            ++i;
            continue;
        }
        if (c == '\xE2' && i + 2 < typed.size() && typed[i + 1] == '\x80' &&
            typed[i + 2] == '\xAF') {
            i += 2;
            continue;
        }
        s += c;
    }
    if (s.empty()) return std::nullopt;
    const size_t commas = std::count(s.begin(), s.end(), ',');
    const size_t points = std::count(s.begin(), s.end(), '.');
    char decimal = 0, grouping = 0;
    if (commas && points) {
        decimal = s.find_last_of(",.") == s.rfind(',') ? ',' : '.';
        grouping = decimal == ',' ? '.' : ',';
    } else if (commas) {
        (commas == 1 ? decimal : grouping) = ',';
    } else if (points) {
        (points == 1 ? decimal : grouping) = '.';
    }
    if (decimal && std::count(s.begin(), s.end(), decimal) > 1) return std::nullopt;
    // Thousands come in groups of three digits, before the decimal separator.
    std::string plain;
    bool seenDecimal = false, grouped = false;
    size_t groupDigits = 0;
    for (char c : s) {
        if (c == grouping) {
            if (seenDecimal || groupDigits == 0 || (grouped && groupDigits != 3))
                return std::nullopt;
            grouped = true;
            groupDigits = 0;
            continue;
        }
        if (c == decimal) {
            if (grouped && groupDigits != 3) return std::nullopt;
            seenDecimal = true;
            plain += '.';
            continue;
        }
        if (c >= '0' && c <= '9' && !seenDecimal) ++groupDigits;
        plain += c;
    }
    if (grouped && !seenDecimal && groupDigits != 3) return std::nullopt;
    return pelta::Decimal::parse(plain);
}

// ---- the extender -------------------------------------------------------------------

AttribGridExtender::AttribGridExtender() {
    services()->addAttribGrid(this);
}

AttribGridExtender::~AttribGridExtender() {
    services()->removeAttribGrid(this);
}

void AttribGridExtender::Init(pelta::Object* Owner, const std::string& GridName,
                              const std::string& Groups) {
    auto parts = splitBars(Groups);
    if (parts.size() % 2 != 0)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The groups of " + GridName + " are not number and caption pairs",
                     "AttribGridExtender.Init");
    std::vector<Group> groups;
    for (size_t i = 0; i < parts.size(); i += 2) {
        Group g;
        if (!wholeNumber(parts[i], g.number) ||
            std::any_of(groups.begin(), groups.end(),
                        [&](const Group& o) { return o.number == g.number; }))
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The group number \"" + parts[i] + "\" of " + GridName +
                             " is not a number or comes twice",
                         "AttribGridExtender.Init");
        g.caption = parts[i + 1];
        groups.push_back(std::move(g));
    }
    setOwner(Owner);
    gridName_ = GridName;
    groups_ = std::move(groups);
}

void AttribGridExtender::AddAttribute(const AttribDecl& Attribute) {
    const char* source = "AttribGridExtender.AddAttribute";
    if (Attribute.Field.empty())
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "An attribute of " + gridName_ + " has no field", source);
    for (const auto& r : rows_)
        if (equalsNoCaseAscii(r.decl.Field, Attribute.Field))
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The grid " + gridName_ + " declares " + Attribute.Field + " twice",
                         source);
    if (std::none_of(groups_.begin(), groups_.end(),
                     [&](const Group& g) { return g.number == Attribute.Group; }))
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The grid " + gridName_ + " has no group " + std::to_string(Attribute.Group),
                     source);
    AttribGridExtender::Attribute a;
    a.decl = Attribute;
    if (Attribute.Editor == AttribEditor::FixedList) {
        auto parts = splitBars(Attribute.Values);
        if (parts.empty() || parts.size() % 2 != 0)
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The values of " + Attribute.Field + " are not value and text pairs",
                         source);
        for (size_t i = 0; i < parts.size(); i += 2)
            a.fixed.emplace_back(parts[i], parts[i + 1]);
    }
    rows_.push_back(std::move(a));
}

std::vector<AttribDecl> AttribGridExtender::Attributes() {
    std::vector<AttribDecl> out;
    out.reserve(rows_.size());
    for (const auto& r : rows_)
        out.push_back(r.decl);
    return out;
}

AttribGridExtender::Attribute& AttribGridExtender::attribute(const std::string& field,
                                                             const char* source) {
    for (auto& r : rows_)
        if (equalsNoCaseAscii(r.decl.Field, field)) return r;
    pelta::raise(pelta::errc::InvalidProcedureCall,
                 "The grid " + gridName_ + " has no attribute " + field, source);
}

void AttribGridExtender::SetList(const std::string& Field, RecordsetRef Rows,
                                 const std::string& KeyField, const std::string& ShownField,
                                 const std::string& ParentField) {
    const char* source = "AttribGridExtender.SetList";
    Attribute& a = attribute(Field, source);
    if (a.decl.Editor != AttribEditor::List && a.decl.Editor != AttribEditor::TreeList)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The attribute " + Field + " of " + gridName_ + " is not a list", source);
    if (!Rows) {
        a.list = List{};
        return;
    }
    for (const std::string* f : {&KeyField, &ShownField, &ParentField}) {
        if (f == &ParentField && f->empty()) continue;
        if (Rows->fieldIndex(*f) < 0)
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The rows offered in " + Field + " have no field " + *f, source);
    }
    a.list = List{std::move(Rows), KeyField, ShownField, ParentField};
}

void AttribGridExtender::Bind(RecordsetRef Head) {
    head_ = std::move(Head);
    editState_ = false;
}

pelta::Recordset& AttribGridExtender::currentHead(const char* source) {
    if (!head_ || head_->bof() || head_->eof() || head_->status() == pelta::RowStatus::Deleted)
        pelta::raise(pelta::errc::ObjectVariableNotSet,
                     "No head row is bound to the grid " + gridName_, source);
    return *head_;
}

pelta::Variant AttribGridExtender::Value(const std::string& Field) {
    Attribute& a = attribute(Field, "AttribGridExtender.Value");
    if (!head_ || head_->bof() || head_->eof() || head_->status() == pelta::RowStatus::Deleted ||
        head_->fieldIndex(a.decl.Field) < 0)
        return {};
    return head_->value(a.decl.Field);
}

// ---- entering values ----------------------------------------------------------------

std::optional<pelta::Variant> AttribGridExtender::toFieldType(const std::string& field,
                                                              const pelta::Variant& value) {
    const pelta::FieldType type = head_->fieldDef(head_->fieldIndex(field)).type;
    if (blank(value)) return pelta::Variant::null();
    try {
        if (isNumberField(type)) {
            if (!value.isNumber() && !value.isString()) return std::nullopt;
            if (value.type() == pelta::VarType::Boolean) return std::nullopt;
            pelta::Decimal d;
            if (value.isString()) {
                auto parsed = parseTypedNumber(value.str());
                if (!parsed) return std::nullopt;
                d = *parsed;
            } else if (value.type() == pelta::VarType::Double) {
                if (type == pelta::FieldType::Double) return value;
                d = pelta::Decimal::fromDouble(value.rawDouble());
            } else {
                d = value.toDecimal();
            }
            switch (type) {
                case pelta::FieldType::Long:
                    if (!(d == d.truncate())) return std::nullopt;  // a fraction
                    return pelta::Variant(pelta::Variant(d).toLong());
                case pelta::FieldType::Double:
                    return pelta::Variant(d.toDouble());
                default:
                    return pelta::Variant(d);
            }
        }
        switch (type) {
            case pelta::FieldType::Boolean:
                return pelta::Variant(value.toBool());
            case pelta::FieldType::Date: {
                if (value.type() == pelta::VarType::Date) return value;
                pelta::Date d;
                if (value.isString() && pelta::parseDate(value.str(), d)) return pelta::Variant(d);
                return std::nullopt;
            }
            case pelta::FieldType::Guid: {
                auto g = value.isString() ? pelta::Guid::parse(value.str()) : std::nullopt;
                if (!g) return std::nullopt;
                return pelta::Variant(g->toString());
            }
            case pelta::FieldType::Binary:
                return std::nullopt;
            default:
                return pelta::Variant(value.toString());
        }
    } catch (const pelta::Error&) {
        return std::nullopt;  // out of range, or no conversion
    }
}

std::optional<pelta::Variant> AttribGridExtender::fromList(const Attribute& a,
                                                           const pelta::Variant& value) {
    if (blank(value)) return pelta::Variant::null();
    if (!a.list.rows) return std::nullopt;
    auto rows = a.list.rows->clone();
    if (rows->recordCount() == 0) return std::nullopt;
    for (rows->moveFirst(); !rows->eof(); rows->moveNext()) {
        pelta::Variant key = rows->value(a.list.keyField);
        if (sameKey(key, value)) return toFieldType(a.decl.Field, key);
    }
    return std::nullopt;
}

std::optional<pelta::Variant> AttribGridExtender::fromFixedList(const Attribute& a,
                                                                const pelta::Variant& value) {
    if (blank(value)) return pelta::Variant::null();
    for (const auto& [v, t] : a.fixed)
        if (sameKey(pelta::Variant(v), value)) return toFieldType(a.decl.Field, pelta::Variant(v));
    return std::nullopt;
}

std::optional<pelta::Variant> AttribGridExtender::convert(const Attribute& a,
                                                          const pelta::Variant& value) {
    switch (a.decl.Editor) {
        case AttribEditor::CheckBox:
            if (value.isNull() || value.isEmpty()) return toFieldType(a.decl.Field, false);
            if (!value.isNumber() && !value.isString()) return std::nullopt;
            try {
                return toFieldType(a.decl.Field, pelta::Variant(value.toBool()));
            } catch (const pelta::Error&) {
                return std::nullopt;
            }
        case AttribEditor::List:
        case AttribEditor::TreeList:
            return fromList(a, value);
        case AttribEditor::FixedList:
            return fromFixedList(a, value);
        case AttribEditor::Entry:
        case AttribEditor::Selector:
            break;
    }
    if (!value.isEmpty() && !value.isNull() && !value.isString() && !value.isNumber() &&
        value.type() != pelta::VarType::Date)
        return std::nullopt;
    return toFieldType(a.decl.Field, value);
}

bool AttribGridExtender::UserSetValue(const std::string& Field, const pelta::Variant& Value) {
    const char* source = "AttribGridExtender.UserSetValue";
    Attribute& a = attribute(Field, source);
    pelta::Recordset& head = currentHead(source);
    const std::string field = a.decl.Field;
    if (head.fieldIndex(field) < 0)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The head bound to " + gridName_ + " has no field " + field, source);

    std::optional<pelta::Variant> typed = convert(a, Value);
    if (!typed) return false;
    pelta::Variant value = std::move(*typed);
    bool cancel = false;
    raise(events_.BeforeUpdate, field, value, cancel);
    if (cancel) return false;

    // The handler may have moved the head or bound another one.
    pelta::Recordset& target = currentHead(source);
    const bool editing = target.editMode() != pelta::EditMode::None;
    const pelta::Variant old = target.value(field);
    try {
        target.setValue(field, value);
        if (!editing) target.update();
    } catch (const pelta::Error&) {
        // The field did not take the value: the old one stays.
        try {
            if (!editing && target.editMode() != pelta::EditMode::None)
                target.cancelUpdate();
            else
                target.setValue(field, old);
        } catch (const pelta::Error&) {
        }
        return false;
    }
    if (!(target.value(field) == old)) editState_ = true;
    raise(events_.AfterUpdate, field);
    return true;
}

void AttribGridExtender::SetValue(const std::string& Field, const pelta::Variant& Value) {
    const char* source = "AttribGridExtender.SetValue";
    Attribute& a = attribute(Field, source);
    pelta::Recordset& head = currentHead(source);
    const bool editing = head.editMode() != pelta::EditMode::None;
    head.setValue(a.decl.Field, Value);
    if (!editing) head.update();
}

void AttribGridExtender::SetShownText(const std::string& Field, const std::string& Text) {
    const char* source = "AttribGridExtender.SetShownText";
    Attribute& a = attribute(Field, source);
    pelta::Recordset& head = currentHead(source);
    if (a.decl.Editor != AttribEditor::Selector || a.decl.ShownField.empty() ||
        head.fieldIndex(a.decl.ShownField) < 0)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The attribute " + Field + " of " + gridName_ + " shows no name of its own",
                     source);
    const bool editing = head.editMode() != pelta::EditMode::None;
    head.setValue(a.decl.ShownField, pelta::Variant(Text));
    if (!editing) head.update();
}

// ---- drawing ------------------------------------------------------------------------

std::string AttribGridExtender::baseText(Attribute& a) {
    const pelta::Variant value = Value(a.decl.Field);
    switch (a.decl.Editor) {
        case AttribEditor::CheckBox:
            return {};
        case AttribEditor::List:
        case AttribEditor::TreeList:
            if (a.list.rows && !value.isNull() && !value.isEmpty()) {
                auto rows = a.list.rows->clone();
                if (rows->recordCount() > 0)
                    for (rows->moveFirst(); !rows->eof(); rows->moveNext())
                        if (sameKey(rows->value(a.list.keyField), value))
                            return text(rows->value(a.list.shownField));
            }
            return text(value);
        case AttribEditor::FixedList:
            for (const auto& [v, t] : a.fixed)
                if (sameKey(pelta::Variant(v), value)) return t;
            return text(value);
        case AttribEditor::Selector:
            if (!a.decl.ShownField.empty() && head_ && head_->fieldIndex(a.decl.ShownField) >= 0 &&
                !value.isEmpty())
                return text(head_->value(a.decl.ShownField));
            return text(value);
        case AttribEditor::Entry:
            break;
    }
    if (value.isNumber() && value.type() != pelta::VarType::Boolean)
        return formatNumber(value, a.decl.Format);
    return text(value);
}

AttribGridExtender::ShownRow AttribGridExtender::shownRow(const std::string& field) {
    Attribute& a = attribute(field, "AttribGridExtender.ShownText");
    ShownRow row;
    row.text = baseText(a);
    const std::string name = a.decl.Field;  // the handler may declare further rows
    raise(events_.RowFormat, name, row.text, row.style);
    return row;
}

std::string AttribGridExtender::ShownText(const std::string& Field) {
    return shownRow(Field).text;
}

std::vector<AttribGridExtender::Choice> AttribGridExtender::choices(const std::string& field) {
    Attribute& a = attribute(field, "AttribGridExtender.choices");
    std::vector<Choice> out;
    if (a.decl.Editor == AttribEditor::FixedList) {
        for (const auto& [v, t] : a.fixed)
            out.push_back(Choice{v, t, {}});
        return out;
    }
    if (!a.list.rows) return out;
    auto rows = a.list.rows->clone();
    if (rows->recordCount() == 0) return out;
    for (rows->moveFirst(); !rows->eof(); rows->moveNext()) {
        Choice c;
        c.key = text(rows->value(a.list.keyField));
        c.text = text(rows->value(a.list.shownField));
        if (!a.list.parentField.empty()) c.parentKey = text(rows->value(a.list.parentField));
        out.push_back(std::move(c));
    }
    return out;
}

// ---- choosing rows ------------------------------------------------------------------

void AttribGridExtender::Select(const std::string& Field) {
    Attribute& a = attribute(Field, "AttribGridExtender.Select");
    if (selected_ == a.decl.Field) return;
    selected_ = a.decl.Field;
    raise(events_.SelChange, selected_);
}

std::string AttribGridExtender::HelpText() {
    for (const auto& r : rows_)
        if (r.decl.Field == selected_) return r.decl.Help;
    return {};
}

void AttribGridExtender::buttonClick(const std::string& field) {
    Attribute& a = attribute(field, "AttribGridExtender.buttonClick");
    if (a.decl.Editor != AttribEditor::Selector)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The attribute " + field + " of " + gridName_ + " has no button",
                     "AttribGridExtender.buttonClick");
    const std::string name = a.decl.Field;
    raise(events_.ButtonClick, name);
}

}  // namespace pelta::fw
