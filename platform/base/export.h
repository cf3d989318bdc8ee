#pragma once

/// Marks what the shared library shows to its users. Everything else has hidden visibility.
#if defined(_WIN32)
#if defined(QUILLMARCH_EDIT_BUILDING)
#define QM_API __declspec(dllexport)
#else
#define QM_API __declspec(dllimport)
#endif
#else
#define QM_API [[gnu::visibility("default")]]
#endif
