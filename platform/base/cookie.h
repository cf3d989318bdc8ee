#pragma once

#include "platform/base/export.h"
#include "platform/base/qx_string.h"

#include <array>
#include <compare>
#include <cstdint>
#include <string_view>

class PStream;

/// The kind of a stored item. Each value is the kind's letter, which begins the cookie's text and so lives in
/// file names: do not change them.
enum class Cookie_Type : uint32_t {
    Control = 'C',
    Edit = 'E',
    Transient = 'F', ///< an edit that is never stored
    Invalid = 'I',
    Material = 'M',
    Project = 'P',
    Sound = 'S',
    TChannel = 'T',
    Video = 'V',
    Template = 'X'
};

/// Identity of a stored item (edit, shot, material, template): three 32-bit words, copied by value. The third
/// word holds the kind letter.
///
/// Text form, eight characters: the kind letter, four base-36 digits of the first word, three of the second,
/// upper case; "P0001000" is kind 'P', words 1 and 0. A first word above 36^4 - 1 or a second above 36^3 - 1
/// cannot be written so; such a cookie is not storable and nothing forms a file name from it.
class QM_API cookie {
public:
    /// The invalid cookie.
    constexpr cookie() = default;

    /// A cookie of a kind from its three words. The third integer is not used beyond the text's reach: the
    /// third word always holds the kind.
    constexpr cookie(Cookie_Type kind, int first, int second, int = 0)
        : m_words{static_cast<uint32_t>(first), static_cast<uint32_t>(second), static_cast<uint32_t>(kind)} {}

    /// Reads the text form; anything but those eight characters gives the invalid cookie, so no text from
    /// outside can name a path. With `anyCase`, lower-case letters are accepted too.
    explicit cookie(std::string_view text, bool anyCase = false);
    explicit cookie(const char* text, bool anyCase = false) : cookie(std::string_view(text), anyCase) {}
    explicit cookie(std::wstring_view text, bool anyCase = false);

    /// From the three words as they are stored; a third word that is no kind gives the invalid cookie.
    [[nodiscard]] static cookie fromWords(uint32_t first, uint32_t second, uint32_t third);

    [[nodiscard]] constexpr uint32_t word(int i) const { return m_words[static_cast<size_t>(i)]; }
    [[nodiscard]] constexpr Cookie_Type type() const { return static_cast<Cookie_Type>(m_words[2]); }
    [[nodiscard]] constexpr char typeChar() const { return static_cast<char>(m_words[2]); }
    /// The kind for a letter; `Cookie_Type::Invalid` for a letter that is none.
    [[nodiscard]] static Cookie_Type type_from_char(char letter);

    /// False for kind 'I'.
    [[nodiscard]] constexpr bool is_valid() const { return type() != Cookie_Type::Invalid; }
    /// True if the cookie is valid and its text holds all of it.
    [[nodiscard]] bool isStorable() const;

    /// Second word 647 and first word not 3: black, an effect graph, an input, the clipboard edit.
    [[nodiscard]] constexpr bool isMagic() const {
        return is_valid() && m_words[1] == magicWord && m_words[0] != aliasWord;
    }
    [[nodiscard]] constexpr bool isBlack() const { return isMagicItem(blackWord); }
    [[nodiscard]] constexpr bool isEffectGraph() const { return isMagicItem(effectGraphWord); }
    /// The alias item; not counted as magic.
    [[nodiscard]] constexpr bool isAlias() const { return isMagicItem(aliasWord); }
    [[nodiscard]] constexpr bool isInput() const { return isMagicItem(inputWord); }
    [[nodiscard]] constexpr bool isClipboard() const { return isMagicItem(clipboardWord); }

    [[nodiscard]] constexpr int compare(const cookie& other) const {
        return *this == other ? 0 : (*this < other ? -1 : 1);
    }
    constexpr auto operator<=>(const cookie&) const = default;

    [[nodiscard]] String asString() const;
    [[nodiscard]] WString asWString() const;

    /// Packed form: the three words, little-endian, in order.
    void pack(PStream& stream) const;
    /// On a short stream, or a third word that is no kind, the cookie becomes invalid.
    void unpack(PStream& stream);

    static constexpr uint32_t magicWord = 647;
    static constexpr uint32_t blackWord = 1;
    static constexpr uint32_t effectGraphWord = 2;
    static constexpr uint32_t aliasWord = 3;
    static constexpr uint32_t inputWord = 4;
    static constexpr uint32_t clipboardWord = 5;

private:
    [[nodiscard]] constexpr bool isMagicItem(uint32_t item) const {
        return is_valid() && m_words[1] == magicWord && m_words[0] == item;
    }
    std::array<uint32_t, 3> m_words{0, 0, static_cast<uint32_t>(Cookie_Type::Invalid)};
};

/// "No item".
inline constexpr cookie invalid_cookie{};
/// The item that stands for black (and silence).
inline constexpr cookie black_cookie{Cookie_Type::Edit, cookie::blackWord, cookie::magicWord};
inline constexpr cookie effect_graph_cookie{Cookie_Type::Edit, cookie::effectGraphWord, cookie::magicWord};
inline constexpr cookie alias_cookie{Cookie_Type::Edit, cookie::aliasWord, cookie::magicWord};
inline constexpr cookie input_cookie{Cookie_Type::Edit, cookie::inputWord, cookie::magicWord};
inline constexpr cookie clipboard_cookie{Cookie_Type::Edit, cookie::clipboardWord, cookie::magicWord};

/// A cookie's fixed short text, with its own storage: `printf("%8s", cookie_string(c).c_str())`.
class QM_API cookie_string {
public:
    explicit cookie_string(const cookie& item);
    [[nodiscard]] const char* c_str() const { return m_text; }
    operator const char*() const { return m_text; }

private:
    char m_text[9];
};

template <>
struct std::hash<cookie> {
    size_t operator()(const cookie& c) const noexcept {
        return (size_t{c.word(0)} << 32 ^ size_t{c.word(1)} << 8 ^ c.word(2)) * 0x9E3779B97F4A7C15u;
    }
};
