#include "edit/model/cue_flags_field.h"
#include "edit/model/strp_field.h"
#include "edit/model/tc_field.h"

#include "platform/base/scanned_number.h"
#include "platform/store/pstream.h"

#include <cmath>
#include <fstream>
#include <utility>

namespace {

constexpr size_t kMaxLine = 1024;

/// Takes one line of at most `kMaxLine` characters, without its end.
bool readLine(std::ifstream* file, String& line) {
    line.clear();
    if (file == nullptr) {
        return false;
    }
    char c = 0;
    bool any = false;
    while (file->get(c)) {
        any = true;
        if (c == '\n') {
            break;
        }
        if (line.size() == kMaxLine) {
            return false;
        }
        line.push_back(c);
    }
    if (!line.empty() && line.back() == '\r') {
        line.pop_back();
    }
    return any;
}

bool writeText(std::ofstream* file, std::string_view text) {
    return file != nullptr && static_cast<bool>(file->write(text.data(), std::ssize(text)));
}

/// True for a revision that this program reads; otherwise the stream is in its error state.
bool accepts(PStream& stream, unsigned revision, unsigned current) {
    if (revision == 0 || revision > current) {
        stream.fail();
    }
    return stream.good();
}

} // namespace

data_field::~data_field() = default;

bool cue_flags_field::read(std::ifstream* file) {
    String line;
    if (!readLine(file, line)) {
        return false;
    }
    return Qx::scanHex(line, m_flags);
}

bool cue_flags_field::write(std::ofstream* file) const {
    return writeText(file, String::format("%08x\n", m_flags));
}

void cue_flags_field::pack(PStream& stream) const {
    stream.setLong(static_cast<int32_t>(m_flags));
}

void cue_flags_field::unpack(PStream& stream, unsigned revision) {
    if (!accepts(stream, revision, currentBuildRevision())) {
        return;
    }
    const auto flags = static_cast<uint32_t>(stream.getLong());
    if (stream.good()) {
        m_flags = flags;
    }
}

void strp_field::set(String text) {
    if (text.size() > kMaxLength) {
        size_t end = kMaxLength;
        while (end > 0 && (static_cast<unsigned char>(text[end]) & 0xC0u) == 0x80u) {
            --end;
        }
        text.resize(end);
    }
    m_text = std::move(text);
}

bool strp_field::read(std::ifstream* file) {
    String line;
    if (!readLine(file, line)) {
        return false;
    }
    const std::vector<String> parts = line.split(' ', true);
    long long length = 0;
    if (parts.size() != 2 || !Qx::textToInt(parts[0], length) || length < 0 || length > kMaxLength) {
        return false;
    }
    String text;
    char c = 0;
    while (length-- > 0) {
        if (!file->get(c)) {
            return false;
        }
        text.push_back(c);
    }
    if (file->get(c) && c == '\r') {
        file->get(c);
    }
    if (*file && c != '\n') {
        return false;
    }
    m_text = std::move(text);
    return true;
}

bool strp_field::write(std::ofstream* file) const {
    return writeText(file, String::format("%zu 0\n", m_text.size())) && writeText(file, m_text) &&
           writeText(file, "\n");
}

void strp_field::pack(PStream& stream) const {
    stream.setString(m_text);
}

void strp_field::unpack(PStream& stream, unsigned revision) {
    if (!accepts(stream, revision, currentBuildRevision())) {
        return;
    }
    String text = stream.getString();
    if (text.size() > kMaxLength) {
        stream.fail();
    }
    if (stream.good()) {
        m_text = std::move(text);
    }
}

bool tc_field::set(double seconds) {
    if (!std::isfinite(seconds)) {
        return false;
    }
    m_time = seconds;
    return true;
}

bool tc_field::read(std::ifstream* file) {
    String line;
    double seconds = 0;
    return readLine(file, line) && Qx::textToDouble(line.trimmed(), seconds) && set(seconds);
}

bool tc_field::write(std::ofstream* file) const {
    return writeText(file, Qx::doubleToText(m_time) + "\n");
}

void tc_field::pack(PStream& stream) const {
    stream.setDouble(m_time);
}

void tc_field::unpack(PStream& stream, unsigned revision) {
    if (!accepts(stream, revision, currentBuildRevision())) {
        return;
    }
    const double seconds = stream.getDouble();
    if (stream.good() && !set(seconds)) {
        stream.fail();
    }
}
