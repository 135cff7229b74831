// Shared helpers of the item detail tests: reading an item as its form does,
// sending every set back, and comparing values as the form would see them.
#pragma once

#include "bll_support.h"
#include "platform/automation/guid.h"

namespace bll_test {

class ItemDetailsBllTest : public BllTest {
protected:
    // The sets the form sends back with "UpdNomItemsDetails".
    static constexpr const char* kSets[] = {
        "Head",         "PriceList",        "SupplPrice",   "ItemsMeasures",    "ItemsParts",
        "RatePrices",   "ItemsDimensions",  "BarCodes",     "ItemsCodes",       "ItmMinQuo",
        "ItemsShelves", "ItemsAttachments", "ItemsSimilar", "ItemsPermissions", "ItemMaterialBoms",
        "Boms",         "BomsDetails",      "Activities",   "ItemsPrefSuppl",   "ItemsVariantDef"};

    std::string itemId(const std::string& code) {
        return scalar("SELECT ID FROM nom_items WHERE Code = ?1", {Variant(code)}).toString();
    }
    std::string idWhere(const std::string& table, const std::string& column,
                        const std::string& value) {
        return scalar("SELECT ID FROM " + table + " WHERE " + column + " = ?1", {Variant(value)})
            .toString();
    }
    std::string measureId(const std::string& code) { return idWhere("nom_measures", "Code", code); }
    Reply read(const std::string& id, bool referentials = false) {
        pelta::PropertyBag request;
        request.writeProperty("ID", Variant(id));
        request.writeProperty("Referentials", Variant(referentials));
        return call(*admin_, "GetNomItemsDetails", &request);
    }
    // A save request that sends back every set the read answered.
    Ref<pelta::PropertyBag> saveOf(const Reply& r, const std::string& id) {
        auto request = pelta::makeRef<pelta::PropertyBag>();
        request->writeProperty("ID", Variant(id));
        for (const char* name : kSets)
            request->writeProperty(name, Variant(pelta::ObjectRef(r.rs(name))));
        request->writeProperty("NeedFetch", Variant(false));
        request->writeProperty("NeedList", Variant("ctxItems|ctxPr"));
        return request;
    }
    Reply save(const Reply& r, const std::string& id) {
        return call(*admin_, "UpdNomItemsDetails", saveOf(r, id).get());
    }
    // Adds a row with a new key and the values given; answers the key.
    static std::string addRow(pelta::Recordset& rs,
                              const std::vector<std::pair<std::string, Variant>>& values) {
        const std::string key = pelta::newGuidString();
        rs.addNew();
        rs.setValue("ID", Variant(key));
        for (const auto& [name, value] : values)
            rs.setValue(name, value);
        rs.update();
        return key;
    }
    // Puts the cursor on the row of `key`.
    static bool seek(pelta::Recordset& rs, const std::string& key) {
        if (rs.recordCount() == 0) return false;
        for (rs.moveFirst(); !rs.eof(); rs.moveNext())
            if (rs.value("ID").toString() == key) return true;
        return false;
    }
    // Values as the form compares them: numbers by value, keys without case.
    static bool same(const Variant& a, const Variant& b) {
        if (a.isNull() || b.isNull() || a.isEmpty() || b.isEmpty())
            return (a.isNull() || a.isEmpty()) == (b.isNull() || b.isEmpty());
        if (a.isBytes() || b.isBytes()) return a.isBytes() && b.isBytes() && a.bytes() == b.bytes();
        if (a.type() == pelta::VarType::Boolean || b.type() == pelta::VarType::Boolean)
            return a.toBool() == b.toBool();
        if (!a.isString() && !b.isString()) return a.toDecimal() == b.toDecimal();
        std::string x = a.toString(), y = b.toString();
        for (auto* s : {&x, &y})
            for (char& c : *s)
                if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
        return x == y;
    }
    static pelta::Decimal D(const char* text) { return pelta::Decimal::parse(text).value(); }
};

}  // namespace bll_test
