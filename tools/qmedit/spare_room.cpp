#include "tools/qmedit/spare_room.h"

#include <algorithm>
#include <string>

Qx::Status SpareRoom::take(const String& besideFile, uint64_t bytes) {
    m_file.emplace(besideFile);
    // No zeros: a file system may keep them without taking any room.
    const std::string block(65536, '\x5a');
    while (bytes > 0) {
        const uint64_t size = std::min<uint64_t>(bytes, block.size());
        if (const Qx::FileError error = m_file->write(block.data(), size)) {
            m_file.reset();
            return Qx::Status::failure(error.text());
        }
        bytes -= size;
    }
    return {};
}
