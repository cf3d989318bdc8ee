#pragma once

#include "edit/model/edit.h"

#include <unordered_map>

namespace interchange::detail {

using CookieMap = std::unordered_map<cookie, cookie>;

/// Puts other sources in the place of those that the events of an edit name; those that are not in the map
/// stay.
void mapStrips(Edit& edit, const CookieMap& map);

} // namespace interchange::detail
