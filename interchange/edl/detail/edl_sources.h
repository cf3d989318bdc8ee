#pragma once

#include "edit/model/edit.h"
#include "interchange/edl/edl_export.h"

#include <unordered_map>
#include <unordered_set>

namespace interchange::detail {

/// What a list says of one source.
struct EdlSource {
    cookie strip;
    bool black = false;
    String reel;       ///< as it is written
    String fullReel;   ///< the reel that it is made of
    String name;       ///< UTF-8, one line; empty when the reel says it all
    String sourceFile; ///< likewise
    String mediaPath;
    bool drop = false; ///< mode of its timecode
};

/// The sources that an edit plays, each asked for once.
class EdlSources {
public:
    EdlSources(const Edit& edit, Qx::FrameRate rate, const EdlExportOptions& options, LossReport& report);

    /// The number of the source of a strip.
    size_t find(const cookie& strip);
    /// Gives every source its reel. `kept` are the reels that an imported list used.
    void nameReels(const std::unordered_set<std::string>& kept);
    [[nodiscard]] const EdlSource& operator[](size_t index) const { return m_sources[index]; }

private:
    void describe(EdlSource& source);
    void takeHeader(EdlSource& source, const Edit& shot);
    void checkAlike();

    const Edit& m_edit;
    Qx::FrameRate m_rate;
    const EdlExportOptions& m_options;
    LossReport& m_report;
    std::vector<EdlSource> m_sources;
    std::unordered_map<cookie, size_t> m_byStrip;
};

/// A text as one line: control characters are blanks, and none stand at its ends.
String oneLine(std::string_view text);

} // namespace interchange::detail
