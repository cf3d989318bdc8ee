#pragma once

#include "platform/store/configb.h"
#include "tools/qmedit/console.h"

/// A value of a header made fit for a console.
[[nodiscard]] String valueText(const configb::Value& value, const Console& console);
