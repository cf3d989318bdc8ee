#pragma once

#include "interchange/export.h"

#include <string_view>

/// The colours of markers as other tools name them. A cue keeps one as its code.
namespace interchange {

/// The code of a colour's name, from 1; case does not count. 0 for a name that is none.
QM_INTERCHANGE_API int markerColourCode(std::string_view name);

/// The name for a code: "RED". Empty for a code that is none.
QM_INTERCHANGE_API std::string_view markerColourName(int code);

} // namespace interchange
