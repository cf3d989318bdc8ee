#pragma once

/// What opening an item does when its file is or is not there. Values are passed through unchanged.
enum eEditOpenBehaviour {
    eOpenExisting = 0, ///< open the file; fail when there is none
    eOpenNew = 1,      ///< start afresh, whatever is there
    eOpenOrCreate = 2  ///< open the file, or start afresh when there is none
};
