#include "scan/scanner.h"

#include <algorithm>
#include <array>
#include <cstring>

#if defined(__SSE2__)
#include <emmintrin.h>
#endif

#include "base/compiler.h"
#include "base/text.h"
#include "base/token.h"
#include "dict/dictionary.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "scan/pass_facts.h"
#include "source/source_stack.h"

namespace tplex {

namespace {

// Character classes. Codes from 128 up are in none of them.
enum : std::uint8_t {
    cc_letter = 1,  // A-Z a-z
    cc_digit = 2,   // 0-9
    cc_ident = 4,   // letter, digit, underscore
};

constexpr std::array<std::uint8_t, 256> make_classes() {
    std::array<std::uint8_t, 256> t{};
    for (int c = 'A'; c <= 'Z'; ++c) t[c] = cc_letter | cc_ident;
    for (int c = 'a'; c <= 'z'; ++c) t[c] = cc_letter | cc_ident;
    for (int c = '0'; c <= '9'; ++c) t[c] = cc_digit | cc_ident;
    t['_'] = cc_ident;
    return t;
}
constexpr std::array<std::uint8_t, 256> classes = make_classes();
static_assert(classes['_'] == cc_ident && classes[0] == 0 && classes[255] == 0);
static_assert(classes['f'] == (cc_letter | cc_ident) && classes['7'] == (cc_digit | cc_ident));

constexpr std::array<char, 256> make_upper() {
    std::array<char, 256> t{};
    for (int c = 0; c < 256; ++c) t[c] = upper_case(static_cast<char>(c));
    return t;
}
constexpr std::array<char, 256> upper = make_upper();

#if !defined(__SSE2__)
// An identifier character's upper-case form, 0 for any other byte.
constexpr std::array<char, 256> make_ident_upper() {
    std::array<char, 256> t{};
    for (int c = 0; c < 256; ++c)
        if (classes[c] & cc_ident) t[c] = upper[c];
    return t;
}
constexpr std::array<char, 256> ident_upper = make_ident_upper();
#endif

inline bool is_digit(std::uint8_t c) {
    return (classes[c] & cc_digit) != 0;
}
inline bool is_ident(std::uint8_t c) {
    return (classes[c] & cc_ident) != 0;
}

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
#if defined(__SSE2__)
// Sixteen bytes classified at once: the upper-case form of each (letters
// lose their case bit, other bytes stay), and a mask of the bytes that are
// no identifier character (bit i for byte i).
struct ident_block {
    __m128i upper;
    unsigned stop;
};
TPLEX_HOT_INLINE ident_block classify_ident_block(const unsigned char *p) {
    // Signed compares: bytes from 0x80 up are negative, below every bound.
    const __m128i case_bit = _mm_set1_epi8(0x20);
    const __m128i x = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p));
    const __m128i folded = _mm_or_si128(x, case_bit);
    const __m128i letter = _mm_and_si128(_mm_cmpgt_epi8(folded, _mm_set1_epi8('a' - 1)),
                                         _mm_cmplt_epi8(folded, _mm_set1_epi8('z' + 1)));
    const __m128i digit = _mm_and_si128(_mm_cmpgt_epi8(x, _mm_set1_epi8('0' - 1)),
                                        _mm_cmplt_epi8(x, _mm_set1_epi8('9' + 1)));
    const __m128i ident =
        _mm_or_si128(_mm_or_si128(letter, digit), _mm_cmpeq_epi8(x, _mm_set1_epi8('_')));
    return {_mm_andnot_si128(_mm_and_si128(letter, case_bit), x),
            ~static_cast<unsigned>(_mm_movemask_epi8(ident)) & 0xFFFFu};
}
#endif

TPLEX_HOT_INLINE std::size_t take_ident_chars(std::size_t n) {
    const unsigned char *p = read_cursor;
    char *t = tok.text;
#if defined(__SSE2__)
    for (;;) {
        const ident_block b = classify_ident_block(p);
        const unsigned stop = b.stop;
        if (n < word_max) _mm_storeu_si128(reinterpret_cast<__m128i *>(t + n), b.upper);
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
    std::memset(t + n, 0, read_slack);
    return n;
}

// A word whose first character c is taken: its text as take_ident_chars
// leaves it, its length, and its first 16 bytes of text as the dictionary
// keys them in key[0] and key[1]. A word of at most 16 characters, the
// usual one, is done in one 16-byte piece whose key comes from registers:
// reading it back from the text just written in pieces would wait for the
// writes to land.
TPLEX_HOT_INLINE std::size_t take_word(std::uint8_t c, std::uint64_t *key) {
    char *t = tok.text;
#if defined(__SSE2__) && defined(__x86_64__)
    const unsigned char *p = read_cursor;
    const ident_block b = classify_ident_block(p);
    const unsigned stop = b.stop;
    if (stop != 0) {
        const auto k = static_cast<unsigned>(__builtin_ctz(stop));  // characters after c
        const __m128i index = _mm_setr_epi8(0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15);
        const __m128i up = b.upper;
        const __m128i name =
            _mm_and_si128(_mm_or_si128(_mm_slli_si128(up, 1),
                                       _mm_cvtsi32_si128(static_cast<unsigned char>(upper[c]))),
                          _mm_cmplt_epi8(index, _mm_set1_epi8(static_cast<char>(k + 1))));
        _mm_storeu_si128(reinterpret_cast<__m128i *>(t), name);
        _mm_storeu_si128(reinterpret_cast<__m128i *>(t + 16), _mm_setzero_si128());
        key[0] = static_cast<std::uint64_t>(_mm_cvtsi128_si64(name));
        key[1] = static_cast<std::uint64_t>(_mm_cvtsi128_si64(_mm_unpackhi_epi64(name, name)));
        read_cursor = p + k;
        return k + 1;
    }
#endif
    t[0] = upper[c];
    const std::size_t n = take_ident_chars(1);
    key[0] = dict_word_at(t);
    key[1] = dict_word_at(t + 8);
    return n;
}

// A word: looked up, and expanded in place when it names a body.
TPLEX_HOT_INLINE status_code scan_word(std::uint8_t c) {
    std::uint64_t key[2];
    const std::size_t n = take_word(c, key);
    if (dict_lookup_token_key(n, key[0], key[1]) != 1) tok.kind = tk_new_identifier;
    if (tok.kind == tk_macro) return push_macro(tok.def_text1);  // 0: scan the body
    return tok.kind;  // a kind of 0 keeps the scan going too
}

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
    // The first digit as add_digit takes it: no digit of the base fails.
    const std::uint8_t first = digit_values[c];
    status_code result = first < base ? 0 : TPLEX_BAD_DIGIT;
    std::uint32_t number = result == 0 ? first : 0;
    char *t = tok.text;
    t[0] = static_cast<char>(c);
    std::size_t n = 1;
    // Hex digits follow straight from the buffer (they are never comment
    // brackets); one that is no digit of the base is taken, kept in the
    // text, and ends the number with a failure. The text keeps word_max
    // characters; the rest is read and dropped.
    const unsigned char *p = read_cursor;
    if (result >= 0) {
        const unsigned char *q = p;
        for (std::uint8_t d; (d = digit_values[*q]) < base; ++q) number = number * base + d;
        if (digit_values[*q] != no_digit) {
            result = TPLEX_BAD_DIGIT;
            ++q;
        }
        const auto k = static_cast<std::size_t>(q - p);
        const std::size_t keep = std::min(k, word_max - n);
#if defined(__SSE2__)
        // Most numbers are short: one 16-byte copy (the text has room for it,
        // and the buffer 16 readable bytes from its NUL on).
        if (keep <= 16)
            _mm_storeu_si128(reinterpret_cast<__m128i *>(t + n),
                             _mm_loadu_si128(reinterpret_cast<const __m128i *>(p)));
        else
#endif
            std::memcpy(t + n, p, keep);
        n += keep;
        p = q;
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

// A set of bytes that ends a run of characters the scanner can take
// straight from the buffer. The NUL that ends every buffer is always in it,
// so a run never passes its buffer's end.
struct stop_set {
    std::array<bool, 256> table;
    std::array<unsigned char, 5> bytes;  // the same set, for the 16-byte search
};

constexpr stop_set make_stops(unsigned char a, unsigned char b, unsigned char c, unsigned char d) {
    stop_set s{};
    s.bytes = {0, a, b, c, d};
    for (unsigned char x : s.bytes) s.table[x] = true;
    return s;
}

// The first byte at or after p that is in the set. Every buffer the cursor
// reads has 16 readable bytes from its NUL on.
inline const unsigned char *run_end(const unsigned char *p, const stop_set &s) {
#if defined(__SSE2__)
    const __m128i b0 = _mm_set1_epi8(static_cast<char>(s.bytes[0]));
    const __m128i b1 = _mm_set1_epi8(static_cast<char>(s.bytes[1]));
    const __m128i b2 = _mm_set1_epi8(static_cast<char>(s.bytes[2]));
    const __m128i b3 = _mm_set1_epi8(static_cast<char>(s.bytes[3]));
    const __m128i b4 = _mm_set1_epi8(static_cast<char>(s.bytes[4]));
    for (;; p += 16) {
        const __m128i x = _mm_loadu_si128(reinterpret_cast<const __m128i *>(p));
        const __m128i hit =
            _mm_or_si128(_mm_or_si128(_mm_cmpeq_epi8(x, b0), _mm_cmpeq_epi8(x, b1)),
                         _mm_or_si128(_mm_or_si128(_mm_cmpeq_epi8(x, b2), _mm_cmpeq_epi8(x, b3)),
                                      _mm_cmpeq_epi8(x, b4)));
        const unsigned m = static_cast<unsigned>(_mm_movemask_epi8(hit));
        if (m != 0) return p + __builtin_ctz(m);
    }
#else
    while (!s.table[*p]) ++p;
    return p;
#endif
}

// Inside a string: the quote, and the comment bracket characters (the
// character source folds them into markers).
constexpr stop_set string_stops = make_stops('"', '/', '*', ch_end_of_input);

// A string or PDF string, the opening quote (and "<") already taken. Line
// feeds and comment marker codes are ordinary characters here.
status_code scan_string(bool pdf) {
    std::size_t n = 0;
    status_code result = keep_scanning;
    bool complete = false;
    while (!complete && result == keep_scanning) {
        // A run of plain characters, straight from the buffer.
        const unsigned char *p = read_cursor;
        const unsigned char *end = run_end(p, string_stops);
        const std::size_t take = std::min(static_cast<std::size_t>(end - p), string_max - n);
        std::memcpy(tok.text + n, p, take);
        n += take;
        read_cursor = end;

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

// What a character starts, for the scan's one dispatch. Every byte that
// starts no token (control characters, "$", "?", "@", backslash, "_", the
// grave accent, 127 and up, "*/" outside a comment, 254) is cl_bad.
enum : std::uint8_t {
    cl_bad,
    cl_letter,
    cl_digit,
    cl_blank,
    cl_end_of_line,   // a line feed, or the end of a body
    cl_comment,       // "/*"
    cl_line_comment,  // "//"
    cl_end_of_input,
    cl_quote,
    cl_apostrophe,
    cl_hash,
    cl_minus,
    cl_less,
    cl_greater,
    cl_pair,    // an operator alone, or paired with one second character
    cl_single,  // an operator of one character only
    cl_slash,   // "/", which may also open a comment
    cl_star,    // "*", which may also close one
};

struct pair_op {
    std::uint8_t second;  // the character that makes the pair
    std::int32_t value;   // the pair's operator value
};

constexpr std::array<pair_op, 256> make_pairs() {
    std::array<pair_op, 256> t{};
    t['!'] = {'=', op_not_equal};
    t['&'] = {'&', op_and_and};
    t['.'] = {'.', op_dot_dot};
    t['^'] = {'^', op_xor_xor};
    t['|'] = {'|', op_or_or};
    return t;
}
constexpr std::array<pair_op, 256> pairs = make_pairs();

constexpr std::array<std::uint8_t, 256> make_dispatch() {
    std::array<std::uint8_t, 256> t{};
    for (int c = 0; c < 256; ++c) {
        if (classes[c] & cc_letter) t[c] = cl_letter;
        if (classes[c] & cc_digit) t[c] = cl_digit;
        if (pairs[c].second != 0) t[c] = cl_pair;
    }
    t[' '] = t['\t'] = cl_blank;
    t[ch_end_of_body] = t['\n'] = cl_end_of_line;
    t[ch_comment_open] = cl_comment;
    t[ch_line_comment] = cl_line_comment;
    t[ch_end_of_input] = cl_end_of_input;
    t['"'] = cl_quote;
    t['\''] = cl_apostrophe;
    t['#'] = cl_hash;
    t['-'] = cl_minus;
    t['<'] = cl_less;
    t['>'] = cl_greater;
    t['/'] = cl_slash;
    t['*'] = cl_star;
    for (unsigned char c : {'%', '(', ')', '+', ',', ':', ';', '=', '[', ']', '{', '}', '~'})
        t[c] = cl_single;
    return t;
}
constexpr std::array<std::uint8_t, 256> dispatch = make_dispatch();
static_assert(dispatch['_'] == cl_bad && dispatch['$'] == cl_bad && dispatch['\r'] == cl_bad);
static_assert(dispatch[ch_comment_close] == cl_bad && dispatch[254] == cl_bad &&
              dispatch[128] == cl_bad);
static_assert(dispatch['/'] == cl_slash && dispatch['*'] == cl_star && dispatch['z'] == cl_letter);

// A comment cannot simply pass over the closing bytes, nor the bracket
// characters, which the character source may fold into a marker.
constexpr stop_set block_stops = make_stops('/', '*', ch_comment_close, ch_end_of_input);
// A fold never consumes a line feed, so a line comment needs no brackets.
constexpr stop_set line_stops = make_stops('\n', ch_end_of_input, ch_end_of_input, ch_end_of_input);

// Takes characters up to and including the first of the ends.
template <std::uint8_t end>
void skip_comment(const stop_set &stops) {
    for (;;) {
        read_cursor = run_end(read_cursor, stops);
        const std::uint8_t c = next_char();
        if (c == end || c == ch_end_of_body || c == ch_end_of_input) return;
    }
}

// A block comment ends at "*/" (or the end of a body or of input); a line
// comment takes its line feed, so no end of line follows it.
void skip_block_comment() {
    note_block_comment(true);
    skip_comment<ch_comment_close>(block_stops);
    note_block_comment(false);
}
void skip_line_comment() {
    skip_comment<'\n'>(line_stops);
}

inline bool is_blank(std::uint8_t c) {
    return c == ' ' || c == '\t';
}

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
        // read_char, not next_char: the comment brackets are folded below,
        // in the two cases that can start one.
        const std::uint8_t c = read_char();
        status_code result;
        switch (dispatch[c]) {
            case cl_letter:
                result = scan_word(c);
                if (result != keep_scanning) return result;
                continue;  // a name's body is being read, or a word of kind 0
            case cl_digit:
                return scan_number(c, false);
            case cl_blank:
                continue;
            case cl_end_of_line:
                if (skip_line_ends) continue;
                return tk_end_of_line;
            case cl_comment:
                skip_block_comment();
                continue;
            case cl_line_comment:
                skip_line_comment();
                continue;
            case cl_end_of_input:
                tok.kind = tk_end_of_input;
                return tk_end_of_input;
            case cl_quote:
                return scan_string(false);
            case cl_apostrophe:
                return scan_char_literal();
            case cl_hash:
                return scan_hash_word();
            case cl_minus:
                if (is_digit(peek_char())) return scan_number(next_char(), true);
                return op('-');
            case cl_less:
                if (peek_char() == '=') return op_pair('=', op_less_equal, '<');
                if (peek_char() == '<') return op_pair('<', op_shift_left, '<');
                if (peek_char() == '"') {
                    next_char();
                    return scan_string(true);
                }
                return op('<');
            case cl_greater:
                if (peek_char() == '=') return op_pair('=', op_greater_equal, '>');
                return op_pair('>', op_shift_right, '>');
            case cl_slash:
                if (peek_char() == '*') {
                    read_char();
                    skip_block_comment();
                    continue;
                }
                if (peek_char() == '/') {
                    read_char();
                    skip_line_comment();
                    continue;
                }
                return op_pair('=', op_slash_equal, '/');
            case cl_star:
                if (peek_char() == '/') {
                    read_char();
                    return TPLEX_BAD_CHARACTER;  // a "*/" outside a comment
                }
                return op('*');
            case cl_pair:
                return op_pair(pairs[c].second, pairs[c].value, c);
            case cl_single:
                return op(c);
            default:
                return TPLEX_BAD_CHARACTER;
        }
    }
}

}  // namespace

std::uint8_t push_back_flag = 0;

void scanner_reset() {
    push_back_flag = 0;
}

void back_token() {
    push_back_flag = 1;
}

status_code add_digit(std::uint32_t *number, std::uint8_t c, std::uint8_t base) {
    const std::uint8_t d = digit_values[c];  // no_digit is no digit of any base
    if (d >= base) return TPLEX_BAD_DIGIT;
    *number = *number * base + d;
    return 0;
}

status_code scan_token() {
    return scan<false>();
}

namespace {

// The general filter loop below; first is a scan result to start from, or
// keep_scanning.
TPLEX_NOINLINE status_code next_token_general(status_code first);

}  // namespace

// The call for every token. Most tokens are a word, a number or an operator
// in a live region with nothing pushed back, after blanks and line ends:
// those are scanned here, in a function that costs little to enter and
// leave. Everything else (comments, directives, dead regions, a pushed back
// token, the end of a body or of a file) goes to the general filter loop.
status_code next_token_filtered() {
    // Outside every region (depth 0, always live) with nothing pushed back:
    // one test for both.
    if ((push_back_flag | cond_depth) != 0 && (push_back_flag != 0 || !region_live()))
        return next_token_general(keep_scanning);
    status_code r;
    const unsigned char *p;
    std::uint8_t c, n;
    for (;;) {
        p = read_cursor;
        c = *p;
        if (dispatch[c] == cl_blank) {  // mostly one blank; a run is indentation
            c = *++p;
            if (dispatch[c] == cl_blank) {
                read_cursor = p;
                skip_blanks();
                continue;
            }
        }
        n = p[1];
        r = keep_scanning;  // every scan here ends with a kind or a failure
        // An operator is taken here when the next character of the same
        // buffer settles it: not at the buffer's end (n of 0), nor where a
        // comment, a negative number or a PDF string may begin.
        switch (dispatch[c]) {
            case cl_letter:
                read_cursor = p + 1;
                r = scan_word(c);
                // A name's body, a hash word or a word of kind 0 takes the loop.
                if (r <= 0 || r == tk_hash_word || r == tk_end_of_line)
                    return next_token_general(r);
                break;
            case cl_digit:
                read_cursor = p + 1;
                r = scan_number(c, false);
                break;
            case cl_quote:
                read_cursor = p + 1;
                r = scan_string(false);
                break;
            case cl_end_of_line:
                // A line feed at the end of a file's line: the next line.
                if (c != '\n') break;
                read_cursor = p + 1;
                if (n != 0 || next_file_line()) continue;
                return next_token_general(keep_scanning);  // the line feed stays taken
            case cl_single:
                read_cursor = p + 1;
                r = op(c);
                break;
            case cl_pair:
                if (n == 0) break;
                if (n == pairs[c].second) {
                    read_cursor = p + 2;
                    r = op(pairs[c].value);
                } else {
                    read_cursor = p + 1;
                    r = op(c);
                }
                break;
            case cl_less:
                if (n == 0 || n == '"') break;
                read_cursor = p + (n == '=' || n == '<' ? 2 : 1);
                r = op(n == '=' ? int32_t{op_less_equal} : n == '<' ? int32_t{op_shift_left} : '<');
                break;
            case cl_greater:
                if (n == 0) break;
                read_cursor = p + (n == '=' || n == '>' ? 2 : 1);
                r = op(n == '='   ? int32_t{op_greater_equal}
                       : n == '>' ? int32_t{op_shift_right}
                                  : '>');
                break;
            case cl_minus:
                if (n == 0) break;
                if (is_digit(n)) {
                    read_cursor = p + 2;
                    r = scan_number(n, true);
                } else {
                    read_cursor = p + 1;
                    r = op('-');
                }
                break;
            case cl_slash:
                if (n == 0 || n == '*' || n == '/') break;
                read_cursor = p + (n == '=' ? 2 : 1);
                r = op(n == '=' ? int32_t{op_slash_equal} : '/');
                break;
            case cl_star:
                if (n == 0 || n == '/') break;
                read_cursor = p + 1;
                r = op('*');
                break;
            default:
                break;
        }
        if (r == keep_scanning) {
            read_cursor = p;  // the blank is taken either way
            return next_token_general(keep_scanning);
        }
        break;
    }
    char_source_store();
    return r;
}

namespace {

// Where reading stands in the current file. While bodies are pending, the
// file's frame holds its read position, so this changes exactly when a
// character has been read from a file since.
std::uint64_t file_position() {
    const source_frame *f = current_source_frame();
    if (f == nullptr) return 0;
    return std::uint64_t{f->line_no} << 21 | std::uint64_t(source_depth) << 16 | f->read_pos;
}

// In a switched-off region, tokens dropped from bodies are counted from the
// last character read from a file. Only a tree of distinct names that
// multiplies out (four names 20 deep are 4^20 bodies) gets this far: its
// pending bodies are abandoned and the call reports the nesting failure, so
// a call always returns.
constexpr unsigned long max_dropped_from_bodies = 1ul << 22;

// The filter between the scanner and the parser, here so the scan inlines
// into it: hash words are executed, ends of line dropped (the scan passes
// over them itself), the end of input delivered whatever the region, and
// every other result delivered in a live region and dropped in a dead one.
TPLEX_NOINLINE status_code next_token_general(status_code first) {
    status_code r = first;
    unsigned long dropped_from_bodies = 0;
    std::uint64_t counted_from = 0;
    for (;; r = keep_scanning) {
        if (r == keep_scanning) r = scan<true>();
        if (r == tk_hash_word) {
            const status_code d = process_hash_directive();
            if (d < 0) {
                r = d;
                break;
            }
            continue;
        }
        if (r == tk_end_of_input || (r != tk_end_of_line && region_live())) break;
        if (macro_depth == 0) continue;
        // A name nested too deep in a dead region: every pending body is
        // abandoned, as all that is left of them would be dropped too (a body
        // holds a hash word only as its first token, read long since; a name
        // left in one whose own body starts with a hash word goes with them).
        // A name that names itself thus costs 20 expansions and no report.
        if (r == TPLEX_TOO_MANY_MACRO_LEVELS) {
            drop_macros();
            continue;
        }
        const std::uint64_t here = file_position();
        if (here != counted_from) {
            counted_from = here;
            dropped_from_bodies = 0;
        }
        if (++dropped_from_bodies > max_dropped_from_bodies) {
            drop_macros();
            r = TPLEX_TOO_MANY_MACRO_LEVELS;
            break;
        }
    }
    char_source_store();  // the frame's read_pos is true whenever the parser looks
    return r;
}

}  // namespace

}  // namespace tplex
