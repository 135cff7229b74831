#include "platform/automation/object.h"

#include <cxxabi.h>

#include <cstdlib>
#include <memory>
#include <typeinfo>

#include "platform/automation/ascii.h"
#include "platform/automation/error.h"
#include "platform/automation/variant.h"

namespace pelta {

namespace {
std::atomic<int64_t> g_liveObjects{0};
}

Object::Object() noexcept {
    g_liveObjects.fetch_add(1, std::memory_order_relaxed);
}

Object::~Object() {
    g_liveObjects.fetch_sub(1, std::memory_order_relaxed);
}

int64_t Object::liveObjects() noexcept {
    return g_liveObjects.load(std::memory_order_relaxed);
}

Variant Object::invoke(std::string_view member, CallKind, std::span<Variant>) {
    raise(errc::NotSupported, {}, typeName() + "." + std::string(member));
}

std::string Object::typeName() const {
    const char* mangled = typeid(*this).name();
    int status = 0;
    std::unique_ptr<char, void (*)(void*)> demangled(
        abi::__cxa_demangle(mangled, nullptr, nullptr, &status), std::free);
    std::string name = status == 0 && demangled ? demangled.get() : mangled;
    // Automation type names carry no namespace.
    if (auto pos = name.rfind("::"); pos != std::string::npos) name.erase(0, pos + 2);
    return name;
}

bool memberIs(std::string_view member, std::string_view name) noexcept {
    return equalsNoCaseAscii(member, name);
}

Variant callByName(Object* o, std::string_view member, std::span<Variant> args) {
    if (!o) raise(errc::ObjectVariableNotSet, {});
    return o->invoke(member, CallKind::Method, args);
}

Variant getProperty(Object* o, std::string_view member) {
    if (!o) raise(errc::ObjectVariableNotSet, {});
    return o->invoke(member, CallKind::PropertyGet, {});
}

void putProperty(Object* o, std::string_view member, const Variant& value) {
    if (!o) raise(errc::ObjectVariableNotSet, {});
    Variant arg = value;
    o->invoke(member, CallKind::PropertyPut, std::span<Variant>(&arg, 1));
}

}  // namespace pelta
