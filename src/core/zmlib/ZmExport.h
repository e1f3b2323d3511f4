/// \file
/// The export macro of the library's interface.
///
/// The shared library is built with hidden visibility; `ZMLIB_API` marks the classes and functions
/// that form its interface. A static build (`ZMLIB_STATIC`) needs no marking.
#pragma once

// Every public header includes this one, so this is where a too-old language mode is caught, with
// a clear message instead of errors deep in the headers. Any later standard is fine.
#if !defined(__cplusplus) || __cplusplus < 201703L
#error "zmlib needs C++17 or later (for example -std=c++17 or -std=c++20)"
#endif

#if defined(ZMLIB_STATIC)
#define ZMLIB_API
/// `ZMLIB_API` for a class whose values must not be discarded (GCC takes `[[nodiscard]]` on a
/// class only in the standard attribute syntax, so both go into one attribute list).
#define ZMLIB_NODISCARD_API [[nodiscard]]
#else
#define ZMLIB_API __attribute__((visibility("default")))
#define ZMLIB_NODISCARD_API [[nodiscard, gnu::visibility("default")]]
#endif

/// printf-style format checking for the library's variadic formatters.
#define ZMLIB_PRINTF(fmtIndex, firstArg) __attribute__((format(printf, fmtIndex, firstArg)))
