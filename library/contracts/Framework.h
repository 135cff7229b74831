// The library's view of the suite's framework: the client site, the shared
// framework services, the host application, the record-deletion service and
// the detail opener. Extenders are in Extenders.h.
#pragma once

#include <cstdint>
#include <string>

#include "library/contracts/Bll.h"
#include "platform/automation/object.h"
#include "platform/automation/variant.h"

namespace PeltaNom15 {

class IFormExtender;
class IGridExtender;
class IHostApplication;
class IRecordDeletion;

// Handed to a list control or report by the host; yields the connection and
// the parameters the host gives the screen ("MultiSelect", "QuickFindText",
// "CurrentValue" ...).
class IClientSite : public virtual pelta::Object {
public:
    virtual pelta::Ref<IBllConnection> Connection() = 0;
    // Empty when the host gave no parameter of that name.
    virtual pelta::Variant Parameter(const std::string& Name) = 0;
    // True when the screen is embedded as a selector in another screen.
    virtual bool IsSelector() = 0;
};

// The host application's logger, which writes the error log when it exists.
class IHostLogger : public virtual pelta::Object {
public:
    virtual bool Open(const std::string& FileName) = 0;
    virtual void Print(const std::string& Line) = 0;
    virtual int64_t Length() = 0;
    virtual void Close() = 0;
};

// The host's debug console and the register of live objects of all libraries.
class IDebugConsole : public virtual pelta::Object {
public:
    virtual int32_t NextInstanceID() = 0;
    // False when the key is already registered.
    virtual bool AddInstance(const std::string& Key, const std::string& Description) = 0;
    // False when the key was not registered.
    virtual bool RemoveInstance(const std::string& Key) = 0;
    virtual int32_t InstanceCount() = 0;
    virtual void RefreshConsole() = 0;
};

class IHostApplication : public virtual pelta::Object {
public:
    // Used in the error-log file name; may be empty.
    virtual std::string LogName() = 0;
    // Offered every trapped error; answers an action code (kErrorHookRetry:
    // handled, the caller neither logs nor raises).
    virtual int32_t ErrorHook(int32_t Number, const std::string& Source,
                              const std::string& Description, const std::string& Location) = 0;
    // Null when the host writes no logs itself.
    virtual pelta::Ref<IHostLogger> Logger() = 0;
    // Null when the host has no debug console.
    virtual pelta::Ref<IDebugConsole> DebugConsole() = 0;
    // Creates a form by programmatic identifier; null when it cannot.
    virtual pelta::ObjectRef CreateForm(const std::string& ProgID) = 0;
    // Options of the suite ("SearchByCodeFirst", "MatchMode" ...); Empty when unset.
    virtual pelta::Variant Option(const std::string& Name) = 0;
};

// One shared instance for the whole process.
class IFrameworkServices : public virtual pelta::Object {
public:
    virtual pelta::Ref<IHostApplication> HostApplication() = 0;
    // Shows a message box; answers the button (vbYes, vbCancel ...).
    virtual int32_t MsgBox(const std::string& Text, int32_t Style, const std::string& Caption,
                           const std::string& Details) = 0;
    // Objects of other libraries by programmatic identifier; null when refused.
    virtual pelta::ObjectRef CreateObject(const std::string& ProgID) = 0;
    virtual pelta::Ref<IRecordDeletion> RecordDeletion() = 0;
    virtual int32_t MousePointer() = 0;
    virtual void SetMousePointer(int32_t Pointer) = 0;
    // Shows a selector (a list control of a library that implements
    // IZonSelector) to the person for choosing, modally: the person stands on
    // or marks rows of its list, using its quick filter, and chooses or
    // cancels. On a choice the selector's ShowSelect answers `Result` (the
    // IZonSelector::GetNextItem walk follows it). The selector must have had
    // its InitClientSite; its list is read when it is first shown. `Caption`
    // titles the dialog (empty: the list's caption). False when cancelled or
    // nothing was chosen.
    virtual bool ShowSelector(pelta::Object* Selector, const std::string& Caption,
                              pelta::Variant& Result) = 0;
};

// Deletes records of lists and finds open detail forms.
class IRecordDeletion : public virtual pelta::Object {
public:
    // Deletes the marked rows of the list's grid (the current row when none
    // is marked) through `Operation`, sending the values of `KeyField`.
    // With `OnlyInactive` only rows whose "IsActive" is False are sent.
    // Answers True when the service deleted them.
    virtual bool DeleteRecords(IBllConnection* Connection, IGridExtender* Grid, IFormExtender* Form,
                               int32_t CallKind, const std::string& Operation,
                               const std::string& KeyField, bool OnlyInactive) = 0;
    // Deletes one record by key.
    virtual bool DeleteRecord(IBllConnection* Connection, IFormExtender* Form, int32_t CallKind,
                              const std::string& Operation, const std::string& KeyField,
                              const std::string& Key) = 0;
    // The detail form already open for the list whose form extender is given.
    virtual pelta::ObjectRef FindDetailForm(IFormExtender* ListForm) = 0;
};

// One per list: the rights of the current user on the list's details.
class IDetailOpener : public virtual pelta::Object {
public:
    // `ScreenName` is the list's object name ("ctxRatios"), whose rights are asked.
    virtual void Init(IClientSite* Site, const std::string& LayoutKey,
                      const std::string& ScreenName) = 0;
    virtual bool HasRight(int32_t RightFlag) = 0;
};

// Programmatic identifiers under which the framework offers its objects.
inline constexpr const char* kProgIdFrameworkServices = "PeltaCm15.FrameworkServices";  // shared
inline constexpr const char* kProgIdFormExtender = "PeltaCm15.FormExtender";
inline constexpr const char* kProgIdGridExtender = "PeltaCm15.GridExtender";
inline constexpr const char* kProgIdDetailOpener = "PeltaCm15.DetailOpener";
inline constexpr const char* kProgIdTreeExtender = "PeltaCm15.TreeExtender";
inline constexpr const char* kProgIdSplitterExtender = "PeltaCm15.SplitterExtender";
inline constexpr const char* kProgIdTabExtender = "PeltaCm15.TabExtender";
inline constexpr const char* kProgIdQuickFilterExtender = "PeltaCm15.QuickFilterExtender";
inline constexpr const char* kProgIdFooterExtender = "PeltaCm15.FooterExtender";
inline constexpr const char* kProgIdPresetExtender = "PeltaCm15.PresetExtender";
inline constexpr const char* kProgIdReportExtender = "PeltaCm15.ReportExtender";
inline constexpr const char* kProgIdFieldExtender = "PeltaCm15.FieldExtender";
inline constexpr const char* kProgIdFilterBandExtender = "PeltaCm15.FilterBandExtender";
inline constexpr const char* kProgIdCacheDefExtender = "PeltaCm15.CacheDefExtender";
inline constexpr const char* kProgIdAttribGridExtender = "PeltaCm15.AttribGridExtender";

}  // namespace PeltaNom15
