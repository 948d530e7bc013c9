// The per-token path is a handful of small functions; the few that must be
// inlined into the scan loop, whatever the compiler's own judgement, say so.
#ifndef TPLEX_LEX_HOT_H
#define TPLEX_LEX_HOT_H

#if defined(__GNUC__)
#define TPLEX_HOT_INLINE inline __attribute__((always_inline))
#else
#define TPLEX_HOT_INLINE inline
#endif

#endif
