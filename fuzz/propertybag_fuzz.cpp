// Decodes untrusted bag bytes; whatever decodes must encode and decode again
// to the same bytes. Only pelta::Error may escape the decoder.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <span>

#include "platform/automation/error.h"
#include "platform/data/propertybag.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    using namespace pelta;
    Ref<PropertyBag> bag;
    try {
        bag = PropertyBag::fromContents(std::span<const uint8_t>(data, size));
    } catch (const Error&) {
        return 0;
    }
    // A decoded bag is always writable, and writing is stable.
    Bytes first = bag->contents();
    Bytes second = PropertyBag::fromContents(first)->contents();
    if (first != second) std::abort();
    for (const auto& name : bag->names())
        if (!bag->hasProperty(name)) std::abort();
    return 0;
}
