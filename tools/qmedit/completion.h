#pragma once

#include "tools/qmedit/command_line.h"

/// Completion of command lines. The scripts of the shells hold no list of anything: they hand the words of
/// the line to `qmedit --complete`, which answers from the declared commands and from the project.

inline constexpr const char* kCompleteWord = "--complete";
/// Answers of one line that stand for the shell's own completion of files and of folders.
inline constexpr const char* kCompleteFiles = ":files";
inline constexpr const char* kCompleteFolders = ":folders";

/// What the last of the words, which may be empty, can become; the others stand before it on the line. A line
/// each: the word, and behind a tab what it stands for where there is more to say. Empty when nothing fits.
[[nodiscard]] String completionsFor(const std::vector<CommandGroup>& groups, std::vector<String> words);

/// The frame rates that an edit may have, as they are written.
inline constexpr const char* kFrameRates[] = {"23.976", "24", "25", "29.97", "30",
                                              "47.952", "48", "50", "59.94", "60"};

/// The completion script for "bash", "zsh" or "fish"; empty for another shell.
[[nodiscard]] String completionScript(const String& shell);
