#include "platform/store/configb.h"
#include "platform/store/detail/header_values.h"
#include "platform/store/pstream.h"
#include "platform/store/text_file.h"

#include <algorithm>
#include <iterator>

using namespace Qx::detail;

namespace {

// The type bytes live in files: do not change them. They follow the order of the variant.
constexpr uint8_t kIntType = 1;
constexpr uint8_t kInt64Type = 2;
constexpr uint8_t kDoubleType = 3;
constexpr uint8_t kStringType = 4;
constexpr uint8_t kCookieType = 5;
constexpr uint8_t kBoolType = 6;
constexpr uint8_t kForeignType = 7;

/// A key of one letter, a type byte and a bool.
constexpr size_t kLeastEntrySize = 4 + 1 + 1 + 1;

struct ValuePacker {
    PStream& stream;
    void operator()(int32_t number) const { stream.setLong(number); }
    void operator()(int64_t number) const { stream.setUnsignedLongLong(static_cast<uint64_t>(number)); }
    void operator()(double real) const { stream.setDouble(real); }
    void operator()(const String& text) const { stream.setString(text); }
    void operator()(const cookie& item) const { item.pack(stream); }
    void operator()(bool flag) const { stream.setCookedChar(flag ? 1 : 0); }
};

configb::Value unpackCookie(PStream& stream) {
    cookie item;
    item.unpack(stream);
    return item;
}

configb::Value unpackBool(PStream& stream) {
    const uint8_t flag = stream.getCookedChar();
    if (flag > 1) {
        stream.fail();
    }
    return flag == 1;
}

configb::Value unpackValue(uint8_t type, PStream& stream) {
    switch (type) {
    case kIntType:
        return stream.getLong();
    case kInt64Type:
        return static_cast<int64_t>(stream.getUnsignedLongLong());
    case kDoubleType:
        return stream.getDouble();
    case kStringType:
    case kForeignType:
        return stream.getString();
    case kCookieType:
        return unpackCookie(stream);
    case kBoolType:
        return unpackBool(stream);
    default:
        stream.fail();
        return int32_t{0};
    }
}

bool isLine(const String& line, const String& expected) {
    return line == expected || line.trimmed() == expected;
}

Qx::Status complain(const TextFile& file, size_t line, const String& what) {
    const String place = file.path().empty() ? String() : file.path() + ", ";
    return Qx::Status::failure(Qx::StatusCode::Damaged,
                               place + "line " + std::to_string(line + 1) + ": " + what);
}

} // namespace

void configb::writeTo(TextFile& file) const {
    file.appendLine(m_name);
    for (const Entry& there : m_order) {
        if (there.key.empty()) {
            continue;
        }
        const bool foreign = !there.foreignType.empty();
        String line = there.key + ":";
        line += foreign ? std::string_view(there.foreignType) : kHeaderTypeNames[there.value.index()];
        line += ' ';
        line += foreign ? std::get<String>(there.value) : headerValueText(there.value);
        file.appendLine(std::move(line));
    }
    file.appendLine(m_endMarker);
}

bool configb::readLine(std::string_view line, String& complaint) {
    const size_t colon = line.find(':');
    const std::string_view key = line.substr(0, colon);
    if (colon == std::string_view::npos || !isHeaderKey(key)) {
        complaint = quoted(line) + " is not of the form KEY:type value";
        return false;
    }
    const std::string_view rest = line.substr(colon + 1);
    const size_t blank = rest.find(' ');
    const std::string_view type = rest.substr(0, blank);
    const std::string_view text =
        blank == std::string_view::npos ? std::string_view() : rest.substr(blank + 1);
    const auto* known = std::find(std::begin(kHeaderTypeNames), std::end(kHeaderTypeNames), type);
    if (known == std::end(kHeaderTypeNames)) {
        if (!isForeignType(type)) {
            complaint = "key " + quoted(key) + " has no type behind its colon";
            return false;
        }
        return put(key, Value(String(text)), String(type));
    }
    Value value;
    if (!readHeaderValue(static_cast<size_t>(known - std::begin(kHeaderTypeNames)), text, value)) {
        complaint = "the value " + quoted(text) + " of key " + quoted(key) + " is no " + String(type);
        return false;
    }
    return put(key, std::move(value), String());
}

Qx::Status configb::buildFrom(const TextFile& file, unsigned from, unsigned& after) {
    if (from >= file.numLines() || !isLine(file[from], m_name)) {
        return complain(file, from, "the header " + quoted(m_name) + " does not begin here");
    }
    configb read(m_name, m_endMarker);
    unsigned line = from + 1;
    while (line < file.numLines() && !isLine(file[line], m_endMarker)) {
        String complaint;
        if (!read.readLine(file[line], complaint)) {
            return complain(file, line, complaint);
        }
        ++line;
    }
    if (line >= file.numLines() && !m_endMarker.empty()) {
        return complain(file, line, "the text ends before the line " + quoted(m_endMarker));
    }
    takeValues(read);
    after = std::min(line + 1, file.numLines());
    return {};
}

void configb::packEntry(const Entry& entry, PStream& stream) {
    const bool foreign = !entry.foreignType.empty();
    stream.setString(entry.key);
    stream.setCookedChar(foreign ? kForeignType : static_cast<uint8_t>(kIntType + entry.value.index()));
    if (foreign) {
        stream.setString(entry.foreignType);
    }
    std::visit(ValuePacker{stream}, entry.value);
}

void configb::pack(PStream& stream) const {
    stream.setUnsignedLong(static_cast<uint32_t>(size()));
    for (const Entry& there : m_order) {
        if (!there.key.empty()) {
            packEntry(there, stream);
        }
    }
}

bool configb::unpackEntry(PStream& stream) {
    const String key = stream.getString();
    const uint8_t type = stream.getCookedChar();
    String foreignType = type == kForeignType ? stream.getString() : String();
    Value value = unpackValue(type, stream);
    const bool sound =
        stream.good() && isHeaderKey(key) && !contains(key) &&
        (type != kForeignType || (isForeignType(foreignType) && isOneLine(std::get<String>(value))));
    return sound && put(key, std::move(value), std::move(foreignType));
}

void configb::unpack(PStream& stream) {
    configb read(m_name, m_endMarker);
    const uint32_t count = stream.getCount(kLeastEntrySize);
    for (uint32_t i = 0; i < count; ++i) {
        if (!read.unpackEntry(stream)) {
            stream.fail();
            return;
        }
    }
    if (stream.good()) {
        takeValues(read);
    }
}
