// Helpers common to the suite's libraries: value conversions that never
// raise, text helpers, diagnostics of values, and the termination routines.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "platform/automation/variant.h"

namespace PeltaNom15 {

// ---- conversions: the typed value, or the type's empty value -----------------
// A string is returned unchanged; booleans are written "True"/"False".
std::string C2Str(const pelta::Variant& Value);
int32_t C2Lng(const pelta::Variant& Value);
double C2Dbl(const pelta::Variant& Value);
pelta::Date C2Date(const pelta::Variant& Value);
// The texts "True" and "False" are accepted.
bool C2Bool(const pelta::Variant& Value);
pelta::ObjectRef C2Obj(const pelta::Variant& Value);
// A byte array, or an array of byte values; empty for anything else.
pelta::Bytes C2Bytes(const pelta::Variant& Value);

// ---- texts -----------------------------------------------------------------
// Replaces "%1", "%2" ... by the arguments' texts; a "%" inside an argument
// never starts a placeholder, and "%10" is not taken for "%1" followed by 0.
std::string PrintfArgs(std::string_view Template, std::span<const pelta::Variant> Args);
template <class... A>
std::string Printf(std::string_view Template, const A&... Args) {
    const pelta::Variant values[sizeof...(A) + 1] = {pelta::Variant(Args)...};
    return PrintfArgs(Template, std::span<const pelta::Variant>(values, sizeof...(A)));
}
// Doubles every "'" so the text can stand inside a filter literal.
std::string SqlQuote(std::string_view Text);
// "{XXXXXXXX-XXXX-XXXX-XXXX-XXXXXXXXXXXX}" with hexadecimal digits.
bool IsGuid(std::string_view Text);
std::string Nz(std::string_view Text, std::string_view Default);
// "#,##0" (thousands separated by ","), empty for 0.
std::string FormatCount(int64_t N);
// "hh:nn" when the seconds are 0, else "hh:nn:ss".
std::string FormatTime(pelta::Date T);
template <class T>
T Clamp(T V, T Min, T Max) {
    return V < Min ? Min : (Max < V ? Max : V);
}
// Diagnostic text of any value.
std::string DumpValue(const pelta::Variant& Value);

// ---- termination -------------------------------------------------------------
// Each element is an object (possibly nothing) or an array of elements (a
// collection, walked from its last item to its first). Objects that do not
// implement IZonTerminate are skipped.
//
// Asks each object QueryTerminate(Cancel). When one refuses the walk stops and
// every object that had agreed is called again with Cancel True. When Cancel
// is True on entry, every object is told so and nothing is collected.
void QueryTerminateObjects(bool& Cancel, std::vector<pelta::Variant>& Objects);
// Calls Terminate on each object, sets each element to nothing and empties
// the collections.
void TerminateObjects(std::vector<pelta::Variant>& Objects);
// Terminates each of the references and clears them.
template <class... R>
void TerminateRefs(R&... Refs) {
    std::vector<pelta::Variant> objects{pelta::Variant(pelta::ObjectRef(Refs))...};
    TerminateObjects(objects);
    (Refs.reset(), ...);
}
// Asks the object QueryTerminate. When it refuses: with a message, shows it
// and returns False; without one, asks whether to terminate anyway (Cancel
// raises &H80040000 "Termination canceled"). Then terminates it: True.
bool TerminateObject(pelta::Object* Object, const std::string& Message = {});

}  // namespace PeltaNom15
