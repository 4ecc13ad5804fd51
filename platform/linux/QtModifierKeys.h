#pragma once

#include "platform/ModifierKeys.h"

namespace platform {

class QtModifierKeys final : public ModifierKeys {
public:
    bool isOptionDown() const override;
};

} // namespace platform
