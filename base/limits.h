// The library's fixed sizes. A limit reached is a status code, never growth.
#ifndef TPLEX_BASE_LIMITS_H
#define TPLEX_BASE_LIMITS_H

#include <cstddef>

#include "tplex/lexer.h"

namespace tplex {

inline constexpr int dict_slot_count = 1664;       // dictionary slots
inline constexpr int word_max = 128;               // characters kept of a word or number
inline constexpr int text_size = TPLEX_TEXT_SIZE;  // token and definition texts (2499 + NUL)
inline constexpr int line_size = TPLEX_LINE_SIZE;  // a source line buffer (4999 + NUL)
inline constexpr int path_size = TPLEX_PATH_SIZE;  // a source frame's path (199 + NUL)
inline constexpr int source_frame_count = TPLEX_SOURCE_FRAMES;   // frames 0..19
inline constexpr int max_source_depth = source_frame_count - 1;  // 19 files open at most
inline constexpr int macro_frame_count = 20;                     // pending macro bodies
inline constexpr int cond_flag_count = 21;                       // conditional flags, entries 0..20
inline constexpr int max_cond_depth = cond_flag_count - 1;
inline constexpr int include_dir_entries = 10;  // of which 9 are ever filled
inline constexpr int include_dir_size = 255;    // 254 characters + NUL
inline constexpr int join_buffer_size = 2500;   // directory + "\" + name
// The scanner and the dictionary look at 16 bytes at a time: every buffer
// they read that way (a source line, a macro body, a word in the token's
// text) is followed by this many readable bytes from its NUL on.
inline constexpr std::size_t read_slack = 16;
inline constexpr int reserved_word_count = TPLEX_RESERVED_WORDS;
inline constexpr int hash_word_count = TPLEX_HASH_WORDS;

}  // namespace tplex

#endif
