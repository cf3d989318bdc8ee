#include "edit/model/cue_list.h"

#include "platform/store/pstream.h"

#include <cmath>
#include <utility>

// The packed forms of a cue and of a list of cues. They live in files: do not change them.

namespace {

constexpr const char* kCuesLayer = "cue_list";

const bool kCuesRegistered = [] {
    Streamable::registerBuilder(kCuesLayer,
                                []() -> std::unique_ptr<Streamable> { return std::make_unique<cue_list>(); });
    return true;
}();

} // namespace

void cue_point::pack(PStream& stream) const {
    stream.setCookedChar(strp_field::currentBuildRevision());
    m_text.pack(stream);
    stream.setCookedChar(tc_field::currentBuildRevision());
    m_editTime.pack(stream);
    stream.setDouble(m_stripTime);
    stream.setDouble(m_secondTime);
    stream.setLong(m_channel);
    stream.setLong(m_code);
    stream.setCookedChar(cue_flags_field::currentBuildRevision());
    m_flags.pack(stream);
}

void cue_point::unpack(PStream& stream, unsigned revision) {
    if (revision == 0 || revision > currentBuildRevision()) {
        stream.fail();
        return;
    }
    cue_point read;
    read.m_text.unpack(stream, stream.getCookedChar());
    read.m_editTime.unpack(stream, stream.getCookedChar());
    const double strip = stream.getDouble();
    const double second = stream.getDouble();
    if (!read.setStripTime(strip) || !read.setSecondTime(second)) {
        stream.fail();
    }
    read.m_channel = stream.getLong();
    read.m_code = stream.getLong();
    read.m_flags.unpack(stream, stream.getCookedChar());
    if (stream.good()) {
        *this = std::move(read);
    }
}

constinit const StreamableLayer::Form cue_list::kForm{kCuesLayer, "cues"};

const TagTypeId& cue_list::tagTypeId() const {
    static const TagTypeId& type = *new TagTypeId(kCuesLayer);
    return type;
}

void cue_list::pack(PStream& stream) const {
    stream.setUnsignedLong(static_cast<uint32_t>(m_cues.size()));
    for (const cue_point& cue : m_cues) {
        stream.setCookedChar(cue_point::currentBuildRevision());
        cue.pack(stream);
    }
    stream.setLong(0);
}

void cue_list::unpack(PStream& stream) {
    if (isFromTheFuture()) {
        stream.fail();
        return;
    }
    std::vector<cue_point> cues;
    const uint32_t count = stream.getCount(cue_point::kLeastPackedSize + 1);
    cues.reserve(count); // no more than the stream can hold
    for (uint32_t i = 0; i < count && stream.good(); ++i) {
        cues.emplace_back().unpack(stream, stream.getCookedChar());
    }
    if (stream.getLong() != 0 || !stream.good()) {
        stream.fail();
        return;
    }
    m_cues = std::move(cues);
    setCurrentRevision();
}

std::unique_ptr<Streamable> cue_list::clone(BuilderType) const {
    return std::make_unique<cue_list>(*this);
}
