#pragma once

#include "interchange/edl/edl_tracks.h"

#include <string>

/// A list and its tracks as lines that a person can compare with the list. Times are frames.
std::string printProgramme(const interchange::EdlList& list, const interchange::EdlProgramme& programme,
                           const interchange::LossReport& report);
