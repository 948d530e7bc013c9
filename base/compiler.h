// The few compiler attributes the library uses, in one place.
#ifndef TPLEX_BASE_COMPILER_H
#define TPLEX_BASE_COMPILER_H

// The per-token path is a handful of small functions; the few that must be
// inlined into the scan loop, whatever the compiler's own judgement, say so.
#if defined(__GNUC__)
#define TPLEX_HOT_INLINE inline __attribute__((always_inline))
#else
#define TPLEX_HOT_INLINE inline
#endif

// A function kept out of its caller, so that the caller's quick path stays
// small (no registers to save on the way in and out).
#if defined(__GNUC__)
#define TPLEX_NOINLINE __attribute__((noinline))
#else
#define TPLEX_NOINLINE
#endif

// A global that only the library's own code reads, declared so: the
// compiler then reaches it directly rather than through the symbol table
// (the per-token path reads several). ELF targets; elsewhere a no-op.
#if defined(__GNUC__) && !defined(_WIN32)
#define TPLEX_INTERNAL __attribute__((visibility("hidden")))
#else
#define TPLEX_INTERNAL
#endif

// printf-style argument checking. MinGW checks against the formats of the C
// library it links (which know %zu), not Microsoft's.
#if defined(__MINGW32__)
#define TPLEX_PRINTF_FORMAT(string_index, first_to_check) \
    __attribute__((format(__MINGW_PRINTF_FORMAT, string_index, first_to_check)))
#elif defined(__GNUC__)
#define TPLEX_PRINTF_FORMAT(string_index, first_to_check) \
    __attribute__((format(printf, string_index, first_to_check)))
#else
#define TPLEX_PRINTF_FORMAT(string_index, first_to_check)
#endif

#endif
