// The library's public interfaces, implemented by its screens and called by
// the host and by the suite's other libraries.
#pragma once

#include <cstdint>
#include <string>

#include "library/contracts/Framework.h"
#include "library/contracts/IZonFormDispatcher.h"
#include "library/contracts/IZonTerminate.h"
#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace pelta {
class Recordset;
}

namespace PeltaNom15 {

// A list control created by the host by programmatic identifier.
class IZonListControl : public virtual pelta::Object {
public:
    virtual bool InitClientSite(IClientSite* Site) = 0;
};

// The detail form of a nomenclature as other screens open it.
class IZonNomDetailForm : public virtual pelta::Object {
public:
    // The form's form extender.
    virtual pelta::ObjectRef Form() = 0;
    virtual bool Init(IClientSite* Site) = 0;
    // Shows the record `ID` (empty: a new record); False when refused.
    virtual bool ShowDetail(const std::string& ID) = 0;
    // Shows the record of the current row of `Rows`.
    virtual bool ShowFromRecordset(pelta::Ref<pelta::Recordset> Rows) = 0;
};

// A screen that picks records for another screen.
class IZonSelector : public virtual pelta::Object {
public:
    // Shows the selector; `Result` receives what was chosen. True when
    // something was chosen.
    virtual bool ShowSelect(pelta::Variant& CurrentValue, pelta::Variant& SearchText,
                            pelta::Variant& Result) = 0;
    // The next chosen row's key and name; False when none is left.
    virtual bool GetNextItem(pelta::Variant& ID, pelta::Variant& Name, pelta::Variant& Item) = 0;
    // Resolves typed text to exactly one record.
    virtual bool QuickFind(const std::string& Text, pelta::Variant& Result) = 0;
    virtual bool Reset() = 0;
};

class IZonItemsSelector : public virtual pelta::Object {
public:
    virtual void InitFilter(const std::string& PriceListType, const std::string& Currency,
                            const std::string& Measure, const std::string& Supplier,
                            const std::string& DiscountSchema, const std::string& Store) = 0;
    virtual bool InitMedia(const std::string& Type, const std::string& Value) = 0;
    virtual bool InitDimValue(const std::string& Dimension, const std::string& Value) = 0;
    virtual bool GetItemInfo(const std::string& ID, pelta::Ref<pelta::Recordset>& Prices,
                             pelta::Ref<pelta::Recordset>& MeasureRatios) = 0;
    virtual std::string DiscountSchema() = 0;
    virtual std::string PriceListType() = 0;
};

class IZonGridDimsSelector : public virtual pelta::Object {
public:
    virtual std::string GetColumnName(int32_t Index) = 0;
};

class IZonCgSelector : public virtual pelta::Object {
public:
    virtual bool InitCgType(const std::string& Types, const std::string& SecondRestriction) = 0;
    virtual bool InitDimValue(const std::string& Dimension, const std::string& Value) = 0;
    virtual bool InitMedia(const std::string& Media, const std::string& Value) = 0;
};

class IZonSelectorInit : public virtual pelta::Object {
public:
    virtual bool Init(pelta::Object* Owner, const std::string& Param) = 0;
};

class IZonLotsSelector : public virtual pelta::Object {
public:
    virtual void InitFilter(const std::string& ItemIDs, const std::string& StoreID) = 0;
};

class IZonDepartmentSelector : public virtual pelta::Object {
public:
    virtual void InitCgAndDep(const std::string& CgID, const std::string& DepartmentID) = 0;
};

class IZonModalForm : public virtual pelta::Object {
public:
    virtual bool Init(IClientSite* Site, pelta::Object* Owner, const pelta::Variant& Param) = 0;
};

class IZonReport : public virtual pelta::Object {
public:
    virtual bool InitClientSite(IClientSite* Site) = 0;
    virtual bool ShowReport(const pelta::Variant& Params) = 0;
};

}  // namespace PeltaNom15
