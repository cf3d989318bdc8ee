#pragma once

/// Marks what the interchange library shows to its users. Everything else has hidden visibility.
#if defined(_WIN32)
#if defined(QUILLMARCH_INTERCHANGE_BUILDING)
#define QM_INTERCHANGE_API __declspec(dllexport)
#else
#define QM_INTERCHANGE_API __declspec(dllimport)
#endif
#else
#define QM_INTERCHANGE_API [[gnu::visibility("default")]]
#endif
