#include "scan/scanner.h"

#include <array>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "dict/dictionary.h"
#include "lex/hot.h"
#include "lex/lexer.h"
#include "scan/char_source.h"
#include "scan/directives.h"

namespace tplex {

namespace {


// Character classes. Codes from 128 up are in none of the first four.
enum : std::uint8_t {
    cc_letter = 1,  // A-Z a-z
    cc_digit = 2,   // 0-9
    cc_hex = 4,     // 0-9 A-F a-f
    cc_ident = 8,   // letter, digit, underscore
};

constexpr std::array<std::uint8_t, 256> make_classes() {
    std::array<std::uint8_t, 256> t{};
    for (int c = 'A'; c <= 'Z'; ++c) t[c] = cc_letter | cc_ident;
    for (int c = 'a'; c <= 'z'; ++c) t[c] = cc_letter | cc_ident;
    for (int c = '0'; c <= '9'; ++c) t[c] = cc_digit | cc_hex | cc_ident;
    for (int c = 'A'; c <= 'F'; ++c) t[c] |= cc_hex;
    for (int c = 'a'; c <= 'f'; ++c) t[c] |= cc_hex;
    t['_'] = cc_ident;
    return t;
}
constexpr std::array<std::uint8_t, 256> classes = make_classes();
static_assert(classes['_'] == cc_ident && classes[0] == 0 && classes[255] == 0);
static_assert(classes['f'] == (cc_letter | cc_hex | cc_ident) && classes['g'] == (cc_letter | cc_ident));

constexpr std::array<char, 256> make_upper() {
    std::array<char, 256> t{};
    for (int c = 0; c < 256; ++c)
        t[c] = static_cast<char>(c >= 'a' && c <= 'z' ? c - 32 : c);
    return t;
}
constexpr std::array<char, 256> upper = make_upper();

// An identifier character's upper-case form, 0 for any other byte.
constexpr std::array<char, 256> make_ident_upper() {
    std::array<char, 256> t{};
    for (int c = 0; c < 256; ++c)
        if (classes[c] & cc_ident) t[c] = upper[c];
    return t;
}
constexpr std::array<char, 256> ident_upper = make_ident_upper();

inline bool is_letter(std::uint8_t c) { return (classes[c] & cc_letter) != 0; }
inline bool is_digit(std::uint8_t c) { return (classes[c] & cc_digit) != 0; }
inline bool is_hex(std::uint8_t c) { return (classes[c] & cc_hex) != 0; }
inline bool is_ident(std::uint8_t c) { return (classes[c] & cc_ident) != 0; }

constexpr std::size_t string_max = text_size - 1;  // characters a string keeps
constexpr int32_t keep_scanning = 0;

token_record &tok = current_token;

// Appends the identifier characters that follow in the current buffer to
// text (upper case), keeping at most word_max characters in all, and pads
// the text with 16 zero bytes for the dictionary's compare and hash.
// Reading straight from the buffer is what peek_char + next_char would do:
// an identifier character is never a comment bracket, and a word ends where
// its buffer (a line piece or a body) ends. Every buffer the cursor reads
// has 16 readable bytes from its NUL on, so 16 bytes can be looked at once.
TPLEX_HOT_INLINE std::size_t take_ident_chars(std::size_t n) {
    const unsigned char *p = read_cursor;
    char *t = tok.text;
#if defined(__SSE2__)
    // Signed compares: bytes from 0x80 up are negative, below every bound.
    const __m128i a_minus_1 = _mm_set1_epi8('a' - 1), z_plus_1 = _mm_set1_epi8('z' + 1);
    const __m128i zero_minus_1 = _mm_set1_epi8('0' - 1), nine_plus_1 = _mm_set1_epi8('9' + 1);
    const __m128i underscore = _mm_set1_epi8('_'), case_bit = _mm_set1_epi8(0x20);
    for (;;) {
        const __m128i x = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p));
        const __m128i folded = _mm_or_si128(x, case_bit);
        const __m128i letter = _mm_and_si128(_mm_cmpgt_epi8(folded, a_minus_1),
                                             _mm_cmplt_epi8(folded, z_plus_1));
        const __m128i digit = _mm_and_si128(_mm_cmpgt_epi8(x, zero_minus_1),
                                            _mm_cmplt_epi8(x, nine_plus_1));
        const __m128i ident = _mm_or_si128(_mm_or_si128(letter, digit), _mm_cmpeq_epi8(x, underscore));
        const unsigned stop = ~static_cast<unsigned>(_mm_movemask_epi8(ident)) & 0xFFFFu;
        if (n < word_max) {  // letters lose their case bit
            const __m128i up = _mm_andnot_si128(_mm_and_si128(letter, case_bit), x);
            _mm_storeu_si128(reinterpret_cast<__m128i *>(t + n), up);
        }
        const unsigned k = stop != 0 ? static_cast<unsigned>(__builtin_ctz(stop)) : 16u;
        n += k;
        p += k;
        if (stop != 0) break;
    }
    if (n > word_max) n = word_max;  // the rest was read and dropped
#else
    for (char u; n < word_max && (u = ident_upper[*p]) != 0; ++p) t[n++] = u;
    while (is_ident(*p)) ++p;  // read and dropped
#endif
    read_cursor = p;
    std::memset(t + n, 0, 16);
    return n;
}

// A word: looked up, and expanded in place when it names a body.
TPLEX_HOT_INLINE status_code scan_word(std::uint8_t c) {
    tok.text[0] = upper[c];
    const std::size_t n = take_ident_chars(1);
    if (dict_lookup_token(n) != 1) tok.kind = tk_new_identifier;
    if (tok.kind == tk_macro) return push_macro(tok.def_text1);  // 0: scan the body
    return tok.kind;  // a kind of 0 keeps the scan going too
}

// A digit's value in bases up to 16, or no_digit.
constexpr std::uint8_t no_digit = 0xFF;
constexpr std::array<std::uint8_t, 256> make_digit_values() {
    std::array<std::uint8_t, 256> t{};
    for (auto &v : t) v = no_digit;
    for (int c = '0'; c <= '9'; ++c) t[c] = static_cast<std::uint8_t>(c - '0');
    for (int c = 'A'; c <= 'F'; ++c) t[c] = t[c + 32] = static_cast<std::uint8_t>(c - 55);
    return t;
}
constexpr std::array<std::uint8_t, 256> digit_values = make_digit_values();
static_assert(digit_values['f'] == 15 && digit_values['g'] == no_digit && digit_values['9'] == 9);

// A number, its first character c already taken.
status_code scan_number(std::uint8_t c, bool negative) {
    std::uint8_t base = 10;
    if (c == '0') {
        const std::uint8_t p = peek_char();
        if (p == 'x' || p == 'X' || p == 'b' || p == 'B') {
            base = (p == 'x' || p == 'X') ? 16 : 2;
            next_char();
            c = next_char();  // the first digit, whatever it is
        }
    }
    std::uint32_t number = 0;
    status_code result = add_digit(&number, c, base);
    char *t = tok.text;
    t[0] = static_cast<char>(c);
    std::size_t n = 1;
    // Hex digits follow straight from the buffer (they are never comment
    // brackets); one that is no digit of the base is taken, kept in the
    // text, and ends the number with a failure.
    const unsigned char *p = read_cursor;
    if (result >= 0) {
        for (std::uint8_t d; (d = digit_values[*p]) != no_digit; ++p) {
            if (n < word_max) t[n++] = static_cast<char>(*p);
            if (d >= base) {
                result = TPLEX_BAD_DIGIT;
                ++p;
                break;
            }
            number = number * base + d;
        }
    }
    read_cursor = p;
    t[n] = '\0';
    if (result < 0) {
        tok.value = static_cast<int32_t>(number);
        return result;
    }
    tok.kind = tk_number;
    tok.value = static_cast<int32_t>(negative ? 0u - number : number);
    return tk_number;
}

// Bytes that end a plain run inside a string: the quote, the comment
// bracket characters (the character source folds them), the ends of a
// buffer and of input.
constexpr std::array<bool, 256> make_string_stops() {
    std::array<bool, 256> t{};
    t[0] = t['"'] = t['/'] = t['*'] = t[ch_end_of_input] = true;
    return t;
}
constexpr std::array<bool, 256> string_stops = make_string_stops();

// A string or PDF string, the opening quote (and "<") already taken. Line
// feeds and comment marker codes are ordinary characters here.
status_code scan_string(bool pdf) {
    std::size_t n = 0;
    status_code result = keep_scanning;
    bool complete = false;
    while (!complete && result == keep_scanning) {
        // A run of plain characters, straight from the buffer.
        const unsigned char *p = read_cursor;
        while (!string_stops[*p]) {
            if (n < string_max) tok.text[n++] = static_cast<char>(*p);
            ++p;
        }
        read_cursor = p;

        std::uint8_t c = next_char();
        if (c == '"') {
            if (peek_char() == '"') {
                next_char();  // a doubled quote stands for one
            } else if (!pdf) {
                complete = true;
            } else if (peek_char() == '>') {
                next_char();
                complete = true;
            } else {
                result = TPLEX_BAD_PDF_STRING;
            }
        }
        if (complete || result != keep_scanning) break;
        if (c == ch_end_of_body || c == ch_end_of_input)
            result = TPLEX_END_OF_LINE_IN_STRING;
        else if (n < string_max)
            tok.text[n++] = static_cast<char>(c);
    }
    tok.text[n] = '\0';
    tok.kind = pdf ? tk_pdf_string : tk_string;
    return complete ? tok.kind : result;
}

// A character literal, the opening quote already taken.
status_code scan_char_literal() {
    const std::uint8_t c = next_char();
    if (c == ch_end_of_body || c == ch_end_of_input) return TPLEX_END_OF_LINE_IN_CHAR;
    tok.kind = tk_char;
    tok.text[0] = static_cast<char>(c);
    tok.text[1] = '\0';
    return next_char() == '\'' ? tk_char : TPLEX_BAD_CHARACTER;
}

// "#" and the word directly after it, which must be a hash word.
status_code scan_hash_word() {
    const std::uint8_t c = next_char();
    if (!is_ident(c)) return TPLEX_EXTRA_ENDIF;
    tok.text[0] = upper[c];
    tok.value = 0;
    const std::size_t n = take_ident_chars(1);
    if (dict_lookup_token(n) == 1 && tok.kind == tk_hash_word) return tk_hash_word;
    return TPLEX_EXTRA_ENDIF;
}

inline status_code op(int32_t value) {
    tok.kind = tk_operator;
    tok.value = value;
    return tk_operator;
}

// An operator of one character, or of two when the second follows.
inline status_code op_pair(std::uint8_t second, int32_t pair, int32_t single) {
    if (peek_char() != second) return op(single);
    next_char();
    return op(pair);
}

// Bytes a comment cannot simply pass over: the ends of a buffer and of
// input, the closing bytes, and the bracket characters, which the
// character source may fold into a marker.
constexpr std::array<bool, 256> make_block_stops() {
    std::array<bool, 256> t{};
    t[0] = t['/'] = t['*'] = t[ch_comment_close] = t[ch_end_of_input] = true;
    return t;
}
constexpr std::array<bool, 256> block_stops = make_block_stops();

// A fold never consumes a line feed, so a line comment needs no brackets.
constexpr std::array<bool, 256> make_line_stops() {
    std::array<bool, 256> t{};
    t[0] = t['\n'] = t[ch_end_of_input] = true;
    return t;
}
constexpr std::array<bool, 256> line_stops = make_line_stops();

// Takes characters up to and including the first of the ends.
template <std::uint8_t end1, std::uint8_t end2>
void skip_comment(const std::array<bool, 256> &stops) {
    for (;;) {
        const unsigned char *p = read_cursor;
        while (!stops[*p]) ++p;
        read_cursor = p;
        const std::uint8_t c = next_char();
        if (c == end1 || c == end2 || c == ch_end_of_body || c == ch_end_of_input) return;
    }
}

// A block comment ends at "*/" (or the end of a body or of input); a line
// comment takes its line feed, so no end of line follows it.
void skip_block_comment() { skip_comment<ch_comment_close, ch_comment_close>(block_stops); }
void skip_line_comment() { skip_comment<'\n', '\n'>(line_stops); }

inline bool is_blank(std::uint8_t c) { return c == ' ' || c == '\t'; }

// Skips blanks straight from the buffer: one or two one at a time, a longer
// run (indentation) 16 at a time.
inline void skip_blanks() {
    const unsigned char *p = read_cursor;
    if (!is_blank(*p)) return;
    if (!is_blank(*++p)) {
        read_cursor = p;
        return;
    }
#if defined(__SSE2__)
    const __m128i space = _mm_set1_epi8(' '), tab = _mm_set1_epi8('\t');
    for (;;) {
        const __m128i x = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p));
        const unsigned blank = static_cast<unsigned>(
            _mm_movemask_epi8(_mm_or_si128(_mm_cmpeq_epi8(x, space), _mm_cmpeq_epi8(x, tab))));
        if (blank != 0xFFFFu) {
            read_cursor = p + __builtin_ctz(~blank);
            return;
        }
        p += 16;
    }
#else
    while (is_blank(*p)) ++p;
    read_cursor = p;
#endif
}

// One scan. The filter drops every end of line, so it asks for them to be
// skipped here rather than returned one by one.
template <bool skip_line_ends>
TPLEX_HOT_INLINE status_code scan() {
    if (push_back_flag == 1) {
        push_back_flag = 0;
        return tok.kind;
    }
    for (;;) {
        skip_blanks();
        const std::uint8_t c = next_char();
        status_code result;
        if (is_letter(c)) {
            result = scan_word(c);
        } else if (is_digit(c)) {
            result = scan_number(c, false);
        } else {
            switch (c) {
                case ' ':
                case '\t':
                    continue;
                case ch_end_of_body:
                case '\n':
                    if (skip_line_ends) continue;
                    return tk_end_of_line;
                case ch_comment_open:
                    skip_block_comment();
                    continue;
                case ch_line_comment:
                    skip_line_comment();
                    continue;
                case ch_end_of_input:
                    tok.kind = tk_end_of_input;
                    return tk_end_of_input;
                case '"':
                    return scan_string(false);
                case '\'':
                    return scan_char_literal();
                case '#':
                    return scan_hash_word();
                case '-':
                    if (is_digit(peek_char())) return scan_number(next_char(), true);
                    return op('-');
                case '<':
                    if (peek_char() == '=') return op_pair('=', op_less_equal, '<');
                    if (peek_char() == '<') return op_pair('<', op_shift_left, '<');
                    if (peek_char() == '"') {
                        next_char();
                        return scan_string(true);
                    }
                    return op('<');
                case '>':
                    if (peek_char() == '=') return op_pair('=', op_greater_equal, '>');
                    return op_pair('>', op_shift_right, '>');
                case '!': return op_pair('=', op_not_equal, '!');
                case '&': return op_pair('&', op_and_and, '&');
                case '.': return op_pair('.', op_dot_dot, '.');
                case '/': return op_pair('=', op_slash_equal, '/');
                case '^': return op_pair('^', op_xor_xor, '^');
                case '|': return op_pair('|', op_or_or, '|');
                case '%': case '(': case ')': case '*': case '+': case ',':
                case ':': case ';': case '=': case '[': case ']': case '{':
                case '}': case '~':
                    return op(c);
                default:
                    return TPLEX_BAD_CHARACTER;
            }
        }
        if (result != keep_scanning) return result;
    }
}

}  // namespace

bool is_ident_char(std::uint8_t c) { return is_ident(c); }

status_code add_digit(std::uint32_t *number, std::uint8_t c, std::uint8_t base) {
    std::uint32_t d;
    if (is_digit(c)) {
        d = c - '0';
    } else {
        const auto u = static_cast<std::uint8_t>(upper[c]);
        if (!is_hex(u)) return TPLEX_BAD_DIGIT;
        d = u - 55u;
    }
    if (d >= base) return TPLEX_BAD_DIGIT;
    *number = *number * base + d;
    return 0;
}

status_code scan_token() { return scan<false>(); }

// The filter between the scanner and the parser, here so the scan inlines
// into it: hash words are executed, ends of line dropped (the scan passes
// over them itself), the end of input delivered whatever the region, and
// every other result delivered in a live region and dropped in a dead one.
status_code next_token_filtered() {
    status_code r;
    for (;;) {
        r = scan<true>();
        if (r == tk_hash_word) {
            const status_code d = process_hash_directive();
            if (d < 0) {
                r = d;
                break;
            }
            continue;
        }
        if (r == tk_end_of_input || (r != tk_end_of_line && region_live())) break;
    }
    char_source_store();  // the frame's read_pos is true whenever the parser looks
    return r;
}

}  // namespace tplex
