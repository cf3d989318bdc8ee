#pragma once

#include "edit/inspect/seen_report.h"

/// Texts of what is seen at a time, for other programs.

/// An array of objects, each before its inputs, one a line.
[[nodiscard]] String seenJson(const SeenReport& report);
/// A directed graph in the language of Graphviz, from what is shown to what it is made of.
[[nodiscard]] String seenDot(const SeenReport& report);
