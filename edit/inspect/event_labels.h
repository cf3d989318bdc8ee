#pragma once

#include "edit/inspect/edit_report.h"
#include "edit/material/label_kinds.h"

#include <functional>
#include <map>
#include <utility>
#include <vector>

/// A label that is shown beside events or burnt into a picture: a choice of a tool (`VagueUIFLabel`), or a
/// kind of label on a roll. A plain value.
struct ShownLabel {
    VagueUIFLabel kind = kUIFNone; ///< `kUIFNone` for a kind of label on a roll
    UserLabelSpec spec;
    String name; ///< for people
    /// Reads a settings text ("24P_Timecode", "KeyKode", "scene") or the name of a kind of label
    /// ("Timecode", "Foot/frame"), which is taken from the source's primary medium. False for another text.
    [[nodiscard]] QM_API static bool fromText(const String& text, ShownLabel& label);
};

/// Reads the edit that a strip names; null when it cannot be.
using SourceReader = std::function<EditPtr(const cookie&)>;

/// What labels say along an edit. Labels of sources, their reels and texts are those of the item that plays
/// at a time; the edit's own come from the edit. Each source is read once. Used on one thread; the edit lives
/// as long as this.
class QM_API EventLabels {
public:
    EventLabels(const Edit& edit, SourceReader reader) : m_edit(edit), m_reader(std::move(reader)) {}

    /// What a label says at an edit time of a channel, by its index; empty where nothing plays or nothing is
    /// known.
    [[nodiscard]] String textAt(const ShownLabel& shown, int chan, double editTime,
                                label::Style style = label::Spaced);
    /// The same for what a strip shows at a time of its own.
    [[nodiscard]] String textOf(const ShownLabel& shown, const cookie& strip, double stripTime,
                                double editTime, label::Style style = label::Spaced);
    /// What a burnt-in display reads at an edit time, every choice that it offers and that says something:
    /// name and text, key numbers without the blanks in their prefix, texts cut to the size that it keeps free.
    [[nodiscard]] std::vector<std::pair<String, String>> burnIn(double editTime);

private:
    [[nodiscard]] const EditPtr& source(const cookie& strip);
    [[nodiscard]] String ownText(VagueUIFLabel kind, double editTime) const;

    const Edit& m_edit;
    SourceReader m_reader;
    std::map<cookie, EditPtr> m_sources;
};
