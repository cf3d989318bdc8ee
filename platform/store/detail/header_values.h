#pragma once

#include "platform/store/configb.h"

#include <string_view>

/// What the text and the packed form of a header store share.
namespace Qx::detail {

/// The names of the value types in the text form, by the index of the variant.
inline constexpr std::string_view kHeaderTypeNames[] = {"int", "int64", "double", "string", "cookie", "bool"};

/// True for a key that may stand in a header: not empty, no colon, no control character.
bool isHeaderKey(std::string_view key);

/// True for the name of a type that is not one of ours and may stand in a header line: not empty, no blank
/// and no control character.
bool isForeignType(std::string_view type);

/// True for a text that may stand in a header line as it is.
bool isOneLine(std::string_view text);

/// The text of a value as it stands in a header line, escaped.
String headerValueText(const configb::Value& value);

/// Reads a value of the type with index `type` from its text. False, leaving `value`, when it is none.
bool readHeaderValue(size_t type, std::string_view text, configb::Value& value);

/// A text from outside in quotes for a message: control characters escaped, long ones cut.
String quoted(std::string_view text);

} // namespace Qx::detail
