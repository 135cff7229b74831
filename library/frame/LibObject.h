// Base of every object of the library: counts the live objects so that the
// in-process server can tell whether the library may be unloaded.
#pragma once

#include <cstdint>

#include "platform/automation/object.h"

namespace PeltaNom15 {

class LibObject : public virtual pelta::Object {
public:
    LibObject() noexcept;
    ~LibObject() override;

    static int64_t liveObjects() noexcept;
};

}  // namespace PeltaNom15
