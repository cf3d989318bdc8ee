#pragma once

#include "platform/base/cookie.h"

namespace bench {

/// How many edits are open while opening one of them is measured, and their items.
constexpr int kNumOpenEdits = 200;

[[nodiscard]] inline cookie openItem(int i) {
    return {Cookie_Type::Edit, i + 1, 3};
}

} // namespace bench
