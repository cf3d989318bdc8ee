#pragma once

#include "interchange/export.h"
#include "platform/base/qx_string.h"

#include <string_view>

/// Texts of other tools, which seldom say how they are encoded.
namespace interchange {

/// Windows-1252 (and so Latin-1, but for its control characters) as UTF-8. The five bytes that it leaves
/// undefined become the control characters of Latin-1.
[[nodiscard]] QM_INTERCHANGE_API String utf8OfWindows1252(std::string_view text);

} // namespace interchange
