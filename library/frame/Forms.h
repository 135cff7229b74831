// The library's loaded forms: the one `Forms` collection every form enters
// when it is loaded and leaves when it is unloaded, and the registry of
// creators through which forms (and the other classes the name table hands
// out: report classes and layouts) are made by class name.
#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include "library/frame/LibObject.h"

namespace PeltaNom15 {

// Base of every form of the library. A form is loaded on first use (its
// initialisation calls Load(), and Forms().Add() loads what it creates); a
// loaded form is held by the Forms collection and so stays alive until it is
// unloaded. typeName() is the form's class name ("frmItemsDetails").
class LibForm : public LibObject {
public:
    bool IsLoaded() const noexcept { return m_bLoaded; }
    // Enters the Forms collection (Form_Load runs first); nothing when loaded.
    void Load();
    // Form_QueryUnload, then Form_Unload; either may refuse. Leaves the Forms
    // collection unless refused. True when the form is unloaded afterwards.
    bool Unload();

protected:
    virtual void Form_Load() {}
    virtual void Form_QueryUnload(bool& Cancel) {}
    virtual void Form_Unload(bool& Cancel) {}

private:
    bool m_bLoaded = false;
};

class FormsCollection {
public:
    int32_t Count() const noexcept { return static_cast<int32_t>(m_oItems.size()); }
    // Zero-based, in load order; null when out of range.
    pelta::Ref<LibForm> Item(int32_t Index) const;
    // The loaded forms at this moment, in load order.
    std::vector<pelta::Ref<LibForm>> Items() const { return m_oItems; }
    // Creates the form of class `ClassName` (any case; only names beginning
    // with "frm") and loads it. Raises CannotCreateObject for a name that is
    // not a form of the library.
    pelta::ObjectRef Add(const std::string& ClassName);

private:
    friend class LibForm;
    std::vector<pelta::Ref<LibForm>> m_oItems;
};

// The library's one collection of loaded forms.
FormsCollection& Forms();

using ClassCreator = std::function<pelta::ObjectRef()>;

// Makes `ClassName` creatable by name (compared without regard to case).
// Screens register themselves from a static initialiser of their source:
//   static const bool s_bReg = RegisterFormClass("frmRatiosDetails", [] {
//       return pelta::ObjectRef(pelta::makeRef<frmRatiosDetails>()); });
// Returns the creator it replaced (empty when none), so that a caller can put
// it back; an empty `Creator` removes the class.
ClassCreator RegisterFormClass(std::string_view ClassName, ClassCreator Creator);
bool IsClassRegistered(std::string_view ClassName);
// A new instance of a registered class; raises CannotCreateObject naming the
// class when none is registered or its creator gives nothing.
pelta::ObjectRef CreateRegisteredClass(std::string_view ClassName);

}  // namespace PeltaNom15
