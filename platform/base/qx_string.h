#pragma once

#include "platform/base/export.h"

#include <cstdarg>
#include <string>
#include <string_view>
#include <vector>

/// Text of the library: bytes, by convention UTF-8. It adds operations but no state to `std::string`, so
/// the two convert into each other freely and nothing is lost on the way.
class QM_API String : public std::string {
public:
    using std::string::string;
    String() = default;
    String(const std::string& text) : std::string(text) {}
    String(std::string&& text) noexcept : std::string(std::move(text)) {}
    String(std::string_view text) : std::string(text) {}

    /// Position of an occurrence of `c`, counted from 1: `nthIndex(1, ',')` is the first comma.
    /// Returns -1 when there are fewer occurrences, or when `nth` is below 1.
    [[nodiscard]] int nthIndex(int nth, char c) const;

    /// ASCII letters in upper or lower case; every other byte as it is. Independent of the locale.
    [[nodiscard]] String upper() const;
    [[nodiscard]] String lower() const;

    /// The text without blanks and tabs, line ends and other ASCII white space at either end.
    [[nodiscard]] String trimmed() const;

    /// The pieces between occurrences of `separator`. Empty pieces are kept unless `skipEmpty`.
    [[nodiscard]] std::vector<String> split(char separator, bool skipEmpty = false) const;

    /// Equality without regard to the case of ASCII letters.
    [[nodiscard]] static bool equalNoCase(std::string_view a, std::string_view b);

    /// A text made as by `printf`.
    [[nodiscard]] static String format(const char* form, ...) __attribute__((format(printf, 1, 2)));
    [[nodiscard]] static String vformat(const char* form, va_list arguments);
};

/// Wide text, as used for paths at the library's face.
using WString = std::wstring;

namespace Qx {

/// UTF-8 to wide text. A byte that is not part of valid UTF-8 becomes the lone surrogate U+DC80 + (byte -
/// 0x80), so that any file name survives `narrow(widen(name))` exactly.
QM_API WString widen(std::string_view text);

/// Wide text to UTF-8, the inverse of `widen`. Code points outside Unicode become U+FFFD.
QM_API String narrow(std::wstring_view text);

/// True if `text` is well-formed UTF-8 (no overlong forms, surrogates or code points above U+10FFFF).
QM_API bool isUtf8(std::string_view text);

/// A decimal text of a number that reads back as the same bits, whatever the locale: the shortest such
/// text, with '.' as the decimal point; "inf", "-inf" and "nan" for the values that are not finite.
QM_API String doubleToText(double value);

/// Reads a number written by `doubleToText`, or any plain decimal text. The whole text must be a number.
/// False, leaving `value`, when it is not.
[[nodiscard]] QM_API bool textToDouble(std::string_view text, double& value);

/// Reads a decimal integer; the whole text must be one and in range. False, leaving `value`, otherwise.
[[nodiscard]] QM_API bool textToInt(std::string_view text, long long& value);
[[nodiscard]] QM_API bool textToInt(std::string_view text, int& value);

} // namespace Qx
