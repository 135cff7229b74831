// The currency-rates list.
#pragma once

#include "library/frame/cListFrame.h"

namespace PeltaNom15 {

class ctxRatios final : public cListFrame {
public:
    ctxRatios();
};

}  // namespace PeltaNom15
