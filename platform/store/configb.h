#pragma once

#include "platform/base/cookie.h"
#include "platform/base/export.h"
#include "platform/base/qx_string.h"
#include "platform/base/status.h"
#include "platform/store/dirtiable.h"

#include <cstdint>
#include <map>
#include <variant>
#include <vector>

class PStream;
class TextFile;

/// A store of typed values by key, as in the header of an edit. Keys are matched without regard to the case
/// of ASCII letters and keep the spelling of their first writing and their order. A key is not empty and
/// holds no line end, colon or control character; a write with another key is refused (false).
///
/// Text form: the name on a line of its own, a line a key, the end marker on a line of its own. The line of a
/// key is "KEY:type value", where type is int, int64, double, string, cookie or bool. In a string a backslash
/// is written as two, a line feed as "\n", a carriage return as "\r" and any other control character as
/// "\x" and two hexadecimal digits. A double is its shortest decimal text, or "bits" and its bits as a
/// decimal number where that text would lose some (a NaN that carries a payload), so it reads back as the
/// same bits. A cookie is its text, or "words" and its three words as decimal numbers where it is not
/// storable. A bool is true or false; 1 and 0 are read too. Lines of a type that is not known
/// ("tvtype:textdata pal") are kept and written back as they are; `getString` gives their text. Where a text
/// holds a key twice the later line wins, in the place of the earlier one. Without an end marker the block
/// ends with an empty line or the text.
///
/// A copy has the values, the name and the end marker, no observer, and is not dirty. Not thread-safe: one
/// store is used by one thread at a time.
class QM_API configb {
public:
    using Value = std::variant<int32_t, int64_t, double, String, cookie, bool>;

    /// An empty store. `observer` (not owned, may be null) hears of every change.
    explicit configb(String name = String(), String endMarker = String(), Dirtiable* observer = nullptr);
    configb(const configb& other);
    /// Takes over the values; name, end marker and observer stay. Counts as a change if anything differs.
    configb& operator=(const configb& other);

    [[nodiscard]] const String& name() const { return m_name; }
    [[nodiscard]] const String& endMarker() const { return m_endMarker; }
    void setObserver(Dirtiable* observer) { m_observer = observer; }

    /// \name Values
    /// A read converts between int, int64, double and bool where nothing is lost; a key that is missing or of
    /// another type gives the default. A bool counts as 0 or 1, and only those read as a bool. A write of the
    /// value and type that are there already is no change.
    /// @{
    [[nodiscard]] int getInt(std::string_view key, int defaultValue = 0) const;
    [[nodiscard]] int64_t getInt64(std::string_view key, int64_t defaultValue = 0) const;
    [[nodiscard]] double getDouble(std::string_view key, double defaultValue = 0) const;
    [[nodiscard]] String getString(std::string_view key, const String& defaultValue = String()) const;
    [[nodiscard]] cookie getCookie(std::string_view key, const cookie& defaultValue = invalid_cookie) const;
    [[nodiscard]] bool getBool(std::string_view key, bool defaultValue = false) const;
    bool setInt(std::string_view key, int value);
    bool setInt64(std::string_view key, int64_t value);
    bool setDouble(std::string_view key, double value);
    bool setString(std::string_view key, String value);
    bool setCookie(std::string_view key, const cookie& value);
    bool setBool(std::string_view key, bool value);
    /// @}

    [[nodiscard]] bool contains(std::string_view key) const;
    /// The value under a key; null when there is none. Valid until the next change.
    [[nodiscard]] const Value* find(std::string_view key) const;
    bool set(std::string_view key, Value value);
    /// False when there is no such key.
    bool remove(std::string_view key);
    void clear();
    [[nodiscard]] size_t size() const { return m_index.size(); }
    /// The keys, in order.
    [[nodiscard]] std::vector<String> keys() const;

    /// True since the last `setDirty(false)` if a change was made. `setDirty` does not call the observer.
    [[nodiscard]] bool isDirty() const { return m_dirty; }
    void setDirty(bool dirty) { m_dirty = dirty; }

    /// Appends the text form, name line first and end marker last.
    void writeTo(TextFile& file) const;
    /// Reads the text form from line `from` on, in place of what the store held, and sets `after` to the line
    /// past the end marker. It counts as a change if anything differs. A failure names the line and leaves
    /// the store and `after` as they were.
    Qx::Status buildFrom(const TextFile& file, unsigned from, unsigned& after);

    /// The packed form: a count, then per key its spelling, a type byte and the value.
    void pack(PStream& stream) const;
    /// Reads the packed form in place of what the store held; a change if anything differs. On a bad stream
    /// the stream is in its error state and the store is as it was.
    void unpack(PStream& stream);

    /// True if both hold the same keys, spelled alike, in the same order, with the same types and values
    /// (doubles by their bits). Names and end markers do not count.
    bool operator==(const configb& other) const;

private:
    struct NoCaseLess {
        using is_transparent = void;
        bool operator()(std::string_view a, std::string_view b) const;
    };
    struct Entry {
        String key; ///< empty once the key was removed
        Value value;
        String foreignType; ///< of a value whose type is not known; the value is then its text
    };

    bool put(std::string_view key, Value value, String foreignType);
    [[nodiscard]] const Entry* entry(std::string_view key) const;
    bool readLine(std::string_view line, String& complaint);
    bool unpackEntry(PStream& stream);
    void takeValues(const configb& other);
    void compact();
    void changed();
    static bool sameEntry(const Entry& a, const Entry& b);
    static void packEntry(const Entry& entry, PStream& stream);

    String m_name;
    String m_endMarker;
    Dirtiable* m_observer = nullptr;
    std::vector<Entry> m_order;
    std::map<String, size_t, NoCaseLess> m_index;
    bool m_dirty = false;
};
