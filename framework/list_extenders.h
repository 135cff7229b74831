// The extenders a rich list adds to the frame: bands of filters that set
// what the list shows, and the cache of its result sets.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "framework/extender_base.h"
#include "library/contracts/Extenders.h"
#include "platform/data/recordset.h"

namespace pelta::fw {

using PeltaNom15::RecordsetRef;

class FilterBandExtender : public PeltaNom15::IFilterBandExtender, public ExtenderBase {
public:
    PeltaNom15::FilterBandEvents& Events() override { return events_; }
    void Init(pelta::Object* Owner, const std::string& Caption) override;
    void AddList(int32_t FilterID, const std::string& Caption, RecordsetRef Rows,
                 const std::string& KeyField, const std::string& ShownField,
                 const std::string& FirstEntry) override;
    void AddButton(int32_t FilterID, const std::string& Caption) override;
    // Raise InvalidProcedureCall for a filter the band does not have.
    pelta::Variant Value(int32_t FilterID) override;
    void SetValue(int32_t FilterID, const pelta::Variant& Value) override;

    struct Filter {
        int32_t id = 0;
        std::string caption;
        bool button = false;
        RecordsetRef rows;
        std::string keyField;
        std::string shownField;
        std::string firstEntry;
        pelta::Variant value;
    };
    const std::string& caption() const noexcept { return caption_; }
    const std::vector<Filter>& filters() const noexcept { return filters_; }
    // The entries a list offers: (value, text), the first entry first.
    std::vector<std::pair<pelta::Variant, std::string>> entries(int32_t filterID);
    // The user picks a value (Empty: the first entry), then Change.
    void select(int32_t filterID, const pelta::Variant& value);
    // The user presses a button.
    void click(int32_t filterID);

private:
    Filter& filterRef(int32_t id);

    PeltaNom15::FilterBandEvents events_;
    std::string caption_;
    std::vector<Filter> filters_;
};

class CacheDefExtender : public PeltaNom15::ICacheDefExtender, public ExtenderBase {
public:
    void Init(pelta::Object* Owner, const std::string& DataSource) override;
    std::string DataSource() override { return dataSource_; }
    void AddSet(const std::string& Name, int32_t Slot, const std::vector<std::string>& KeyColumns,
                bool Derived) override;
    bool IsCached(const std::string& Name) override;
    pelta::Variant Item(const std::string& Name) override;
    // Raises InvalidProcedureCall for a set that was not declared.
    void SetItem(const std::string& Name, const pelta::Variant& Value) override;
    void Drop(const std::string& Name) override;
    std::vector<std::string> Missing() override;

    struct Set {
        std::string name;
        int32_t slot = 0;
        std::vector<std::string> keys;
        bool derived = false;
        pelta::Variant value;  // Empty: not cached
        int32_t drops = 0;     // times dropped while cached
    };
    const std::vector<Set>& sets() const noexcept { return sets_; }
    const Set* set(const std::string& name) const;

private:
    Set* find(const std::string& name);

    std::string dataSource_;
    std::vector<Set> sets_;
};

}  // namespace pelta::fw
