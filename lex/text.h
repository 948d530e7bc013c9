// Bounded text helpers: every copy into a fixed field goes through these, so
// nothing is written past a field whatever the source holds.
#ifndef TPLEX_LEX_TEXT_H
#define TPLEX_LEX_TEXT_H

#include <cstddef>
#include <cstring>

namespace tplex {

// Length of a text, reading at most max bytes (a field the parser may have
// filled without a terminator).
inline std::size_t text_length(const char *text, std::size_t max) {
    const void *nul = std::memchr(text, 0, max);
    return nul != nullptr ? static_cast<std::size_t>(static_cast<const char *>(nul) - text) : max;
}

// Copies text into a field of size bytes, cutting it to size - 1
// characters (and reading no further than that); a null text copies as
// empty. Returns the length copied.
inline std::size_t copy_text(char *field, std::size_t size, const char *text) {
    std::size_t n = 0;
    if (text != nullptr) {
        n = text_length(text, size - 1);
        std::memmove(field, text, n);
    }
    field[n] = '\0';
    return n;
}

}  // namespace tplex

#endif
