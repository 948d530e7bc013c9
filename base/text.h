// Bounded text helpers: every copy into a fixed field goes through these, so
// nothing is written past a field whatever the source holds. And the one
// rule of upper case, and the one table of digit values.
#ifndef TPLEX_BASE_TEXT_H
#define TPLEX_BASE_TEXT_H

#include <array>
#include <cstddef>
#include <cstdint>
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

// Equal texts, for compile-time checks of tables.
constexpr bool same_text(const char *a, const char *b) {
    while (*a != '\0' && *a == *b) ++a, ++b;
    return *a == *b;
}

// Names are case-insensitive for the letters a to z only: their upper-case
// form. Every other byte stays as it is.
constexpr char upper_case(char c) {
    return c >= 'a' && c <= 'z' ? static_cast<char>(c - ('a' - 'A')) : c;
}

// A character's value as a digit of a base up to 16 (either case), or
// no_digit, which is no digit of any base.
inline constexpr std::uint8_t no_digit = 0xFF;
constexpr std::array<std::uint8_t, 256> make_digit_values() {
    std::array<std::uint8_t, 256> t{};
    for (auto &v : t) v = no_digit;
    for (int c = '0'; c <= '9'; ++c) t[c] = static_cast<std::uint8_t>(c - '0');
    for (int c = 'A'; c <= 'F'; ++c) t[c] = t[c + 32] = static_cast<std::uint8_t>(c - 'A' + 10);
    return t;
}
inline constexpr std::array<std::uint8_t, 256> digit_values = make_digit_values();
static_assert(digit_values['f'] == 15 && digit_values['G'] == no_digit && digit_values['9'] == 9);

}  // namespace tplex

#endif
