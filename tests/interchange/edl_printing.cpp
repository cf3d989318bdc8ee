#include "edl_printing.h"

#include "platform/media/timecode.h"

using namespace interchange;

namespace {

std::string channelName(EdlChannels channel) {
    if (channel == kEdlPicture) {
        return "V";
    }
    if (channel == kEdlPicture2) {
        return "V2";
    }
    for (int number = 1; number <= kMaxEdlAudio; ++number) {
        if (channel == edlAudio(number)) {
            return "A" + std::to_string(number);
        }
    }
    return "?";
}

std::string printClip(const EdlList& list, const EdlClip& clip) {
    const EdlEvent& event = list.events[clip.event];
    std::string line = " " + std::to_string(clip.recordIn) + "-" + std::to_string(clip.recordOut);
    if (clip.transition > 0) {
        line += " " + std::string(event.typeText().substr(0, event.typeText().rfind(' '))) + " of " +
                std::to_string(clip.transition);
    }
    if (clip.outgoing) {
        const EdlOutgoing& out = *clip.outgoing;
        line += out.black ? " out of black"
                          : " out of " + list.events[out.event].reel + " from " + Qx::doubleToText(out.frame);
    }
    if (clip.black) {
        return line + " black\n";
    }
    line += " " + event.reel + " from " + Qx::doubleToText(clip.sourceIn);
    line += clip.velocity == 1.0 ? "" : " at x" + Qx::doubleToText(clip.velocity);
    line += event.clipName.empty() ? "" : " \"" + event.clipName + "\"";
    line += event.sourceFile.empty() ? "" : " of " + event.sourceFile;
    line += event.effectName.empty() ? "" : " by " + event.effectName;
    line += event.mediaPath.empty() ? "" : " in " + event.mediaPath;
    return line + "\n";
}

} // namespace

std::string printProgramme(const EdlList& list, const EdlProgramme& programme, const LossReport& report) {
    std::string text = "title " + list.title + "\nstart " +
                       Qx::timecodeText(programme.start, list.rate, programme.dropFrame) + "\n";
    for (const EdlTrack& track : programme.tracks) {
        text += channelName(track.channel) + "\n";
        for (const EdlClip& clip : track.clips) {
            text += printClip(list, clip);
        }
    }
    for (const EdlMarker& marker : list.markers) {
        text += "marker " + std::to_string(markerPosition(list, programme, marker)) + " [" + marker.colour +
                "] " + marker.text + "\n";
    }
    for (const String& line : report.lines()) {
        text += line + "\n";
    }
    return text;
}
