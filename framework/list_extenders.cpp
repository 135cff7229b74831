#include "framework/list_extenders.h"

#include <algorithm>

#include "platform/automation/error.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using namespace PeltaNom15;

namespace {

bool sameAscii(std::string_view a, std::string_view b) {
    return a.size() == b.size() && std::equal(a.begin(), a.end(), b.begin(), [](char x, char y) {
               auto low = [](char c) {
                   return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
               };
               return low(x) == low(y);
           });
}

}  // namespace

// ---- FilterBandExtender -------------------------------------------------------------

void FilterBandExtender::Init(pelta::Object* Owner, const std::string& Caption) {
    setOwner(Owner);
    caption_ = Caption;
}

FilterBandExtender::Filter& FilterBandExtender::filterRef(int32_t id) {
    for (auto& f : filters_)
        if (f.id == id) return f;
    pelta::raise(pelta::errc::InvalidProcedureCall,
                 "The band " + caption_ + " has no filter " + std::to_string(id),
                 "FilterBandExtender");
}

void FilterBandExtender::AddList(int32_t FilterID, const std::string& Caption, RecordsetRef Rows,
                                 const std::string& KeyField, const std::string& ShownField,
                                 const std::string& FirstEntry) {
    auto it = std::find_if(filters_.begin(), filters_.end(),
                           [&](const Filter& f) { return f.id == FilterID; });
    if (it == filters_.end()) it = filters_.insert(filters_.end(), Filter{});
    it->id = FilterID;
    it->caption = Caption;
    it->button = false;
    it->rows = std::move(Rows);
    it->keyField = KeyField;
    it->shownField = ShownField;
    it->firstEntry = FirstEntry;
}

void FilterBandExtender::AddButton(int32_t FilterID, const std::string& Caption) {
    Filter f;
    f.id = FilterID;
    f.caption = Caption;
    f.button = true;
    filters_.push_back(std::move(f));
}

pelta::Variant FilterBandExtender::Value(int32_t FilterID) {
    return filterRef(FilterID).value;
}

void FilterBandExtender::SetValue(int32_t FilterID, const pelta::Variant& Value) {
    filterRef(FilterID).value = Value;
}

std::vector<std::pair<pelta::Variant, std::string>> FilterBandExtender::entries(int32_t filterID) {
    const Filter& f = filterRef(filterID);
    std::vector<std::pair<pelta::Variant, std::string>> out;
    if (!f.firstEntry.empty()) out.emplace_back(pelta::Variant(), f.firstEntry);
    if (!f.rows) return out;
    auto rows = f.rows->clone();
    rows->setFilter(f.rows->filter());
    if (rows->recordCount() == 0) return out;
    for (rows->moveFirst(); !rows->eof(); rows->moveNext()) {
        auto shown = rows->value(f.shownField);
        out.emplace_back(rows->value(f.keyField),
                         shown.isNull() || shown.isEmpty() ? std::string() : shown.toString());
    }
    return out;
}

void FilterBandExtender::select(int32_t filterID, const pelta::Variant& value) {
    Filter& f = filterRef(filterID);
    if (f.button)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The filter " + std::to_string(filterID) + " is a button",
                     "FilterBandExtender.select");
    f.value = value;
    raise(events_.Change, filterID, value);
}

void FilterBandExtender::click(int32_t filterID) {
    filterRef(filterID);
    raise(events_.Click, filterID);
}

// ---- CacheDefExtender ---------------------------------------------------------------

void CacheDefExtender::Init(pelta::Object* Owner, const std::string& DataSource) {
    setOwner(Owner);
    dataSource_ = DataSource;
}

CacheDefExtender::Set* CacheDefExtender::find(const std::string& name) {
    for (auto& s : sets_)
        if (sameAscii(s.name, name)) return &s;
    return nullptr;
}

const CacheDefExtender::Set* CacheDefExtender::set(const std::string& name) const {
    return const_cast<CacheDefExtender*>(this)->find(name);
}

void CacheDefExtender::AddSet(const std::string& Name, int32_t Slot,
                              const std::vector<std::string>& KeyColumns, bool Derived) {
    for (const auto& s : sets_)
        if (sameAscii(s.name, Name) || s.slot == Slot)
            pelta::raise(pelta::errc::InvalidProcedureCall,
                         "The cache of " + dataSource_ + " declares " + Name + " (slot " +
                             std::to_string(Slot) + ") twice",
                         "CacheDefExtender.AddSet");
    Set s;
    s.name = Name;
    s.slot = Slot;
    s.keys = KeyColumns;
    s.derived = Derived;
    sets_.push_back(std::move(s));
}

bool CacheDefExtender::IsCached(const std::string& Name) {
    const Set* s = find(Name);
    return s && !s->value.isEmpty();
}

pelta::Variant CacheDefExtender::Item(const std::string& Name) {
    const Set* s = find(Name);
    return s ? s->value : pelta::Variant();
}

void CacheDefExtender::SetItem(const std::string& Name, const pelta::Variant& Value) {
    Set* s = find(Name);
    if (!s)
        pelta::raise(pelta::errc::InvalidProcedureCall,
                     "The cache of " + dataSource_ + " has no set " + Name,
                     "CacheDefExtender.SetItem");
    s->value = Value;
}

void CacheDefExtender::Drop(const std::string& Name) {
    if (Set* s = find(Name); s && !s->value.isEmpty()) {
        s->value.clear();
        ++s->drops;
    }
}

std::vector<std::string> CacheDefExtender::Missing() {
    std::vector<std::string> out;
    for (const auto& s : sets_)
        if (!s.derived && s.value.isEmpty()) out.push_back(s.name);
    return out;
}

}  // namespace pelta::fw
