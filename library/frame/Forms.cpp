#include "library/frame/Forms.h"

#include <algorithm>
#include <map>

#include "library/frame/mdNomGlobals.h"
#include "platform/automation/ascii.h"
#include "platform/automation/error.h"

namespace PeltaNom15 {

namespace {

// Never destroyed: forms may still be released while the process exits.
std::map<std::string, ClassCreator>& creators() {
    static auto* s = new std::map<std::string, ClassCreator>();
    return *s;
}

[[noreturn]] void cannotCreate(std::string_view className) {
    pelta::raise(pelta::errc::CannotCreateObject,
                 "Cannot create object " + std::string(kLibName) + "." + std::string(className),
                 std::string(kLibName));
}

}  // namespace

FormsCollection& Forms() {
    static auto* s = new FormsCollection();
    return *s;
}

void LibForm::Load() {
    if (m_bLoaded) return;
    Form_Load();
    m_bLoaded = true;
    Forms().m_oItems.emplace_back(this);
}

bool LibForm::Unload() {
    if (!m_bLoaded) return true;
    pelta::Ref<LibForm> self(this);  // the collection may hold the last reference
    bool cancel = false;
    Form_QueryUnload(cancel);
    if (cancel) return false;
    Form_Unload(cancel);
    if (cancel) return false;
    m_bLoaded = false;
    auto& items = Forms().m_oItems;
    auto it = std::find(items.begin(), items.end(), self);
    if (it != items.end()) items.erase(it);
    return true;
}

pelta::Ref<LibForm> FormsCollection::Item(int32_t Index) const {
    if (Index < 0 || Index >= Count()) return {};
    return m_oItems[static_cast<size_t>(Index)];
}

pelta::ObjectRef FormsCollection::Add(const std::string& ClassName) {
    if (pelta::lowerAscii(ClassName).rfind("frm", 0) != 0) cannotCreate(ClassName);
    auto form = pelta::queryRef<LibForm>(CreateRegisteredClass(ClassName));
    if (!form) cannotCreate(ClassName);
    form->Load();
    return pelta::ObjectRef(form);
}

ClassCreator RegisterFormClass(std::string_view ClassName, ClassCreator Creator) {
    auto key = pelta::lowerAscii(ClassName);
    auto& map = creators();
    ClassCreator previous;
    if (auto it = map.find(key); it != map.end()) {
        previous = std::move(it->second);
        map.erase(it);
    }
    if (Creator) map.emplace(std::move(key), std::move(Creator));
    return previous;
}

bool IsClassRegistered(std::string_view ClassName) {
    return creators().count(pelta::lowerAscii(ClassName)) != 0;
}

pelta::ObjectRef CreateRegisteredClass(std::string_view ClassName) {
    auto& map = creators();
    auto it = map.find(pelta::lowerAscii(ClassName));
    if (it == map.end()) cannotCreate(ClassName);
    pelta::ObjectRef o = it->second();
    if (!o) cannotCreate(ClassName);
    return o;
}

}  // namespace PeltaNom15
