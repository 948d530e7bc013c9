#include "scan/scanner.h"

#include <array>
#include <cstring>

#include "dict/dictionary.h"
#include "lex/lexer.h"
#include "scan/char_source.h"

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

inline bool is_letter(std::uint8_t c) { return (classes[c] & cc_letter) != 0; }
inline bool is_digit(std::uint8_t c) { return (classes[c] & cc_digit) != 0; }
inline bool is_hex(std::uint8_t c) { return (classes[c] & cc_hex) != 0; }
inline bool is_ident(std::uint8_t c) { return (classes[c] & cc_ident) != 0; }

constexpr std::size_t string_max = text_size - 1;  // characters a string keeps
constexpr int32_t keep_scanning = 0;

token_record &tok = current_token;

// Appends the identifier characters that follow in the current buffer to
// text (upper case), keeping at most word_max characters in all. Reading
// straight from the buffer is what peek_char + next_char would do: an
// identifier character is never a comment bracket, and a word ends where
// its buffer (a line piece or a body) ends.
std::size_t take_ident_chars(std::size_t n) {
    const unsigned char *p = read_cursor;
    while (is_ident(*p)) {
        if (n < word_max) tok.text[n++] = upper[*p];
        ++p;
    }
    read_cursor = p;
    tok.text[n] = '\0';
    return n;
}

// A word: looked up, and expanded in place when it names a body.
status_code scan_word(std::uint8_t c) {
    tok.text[0] = upper[c];
    const std::size_t n = take_ident_chars(1);
    if (dict_lookup_token(n) != 1) tok.kind = tk_new_identifier;
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
    std::uint32_t number = 0;
    status_code result = add_digit(&number, c, base);
    std::size_t n = 0;
    tok.text[n++] = static_cast<char>(c);
    for (const unsigned char *p = read_cursor; result >= 0 && is_hex(*p); ++p) {
        result = add_digit(&number, *p, base);
        if (n < word_max) tok.text[n++] = static_cast<char>(*p);
        read_cursor = p + 1;
    }
    tok.text[n] = '\0';
    if (result < 0) {
        tok.value = static_cast<int32_t>(number);
        return result;
    }
    tok.kind = tk_number;
    tok.value = static_cast<int32_t>(negative ? 0u - number : number);
    return tk_number;
}

// A string or PDF string, the opening quote (and "<") already taken. Line
// feeds and comment marker codes are ordinary characters here.
status_code scan_string(bool pdf) {
    std::size_t n = 0;
    status_code result = keep_scanning;
    bool complete = false;
    while (!complete && result == keep_scanning) {
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

void skip_block_comment() {
    std::uint8_t c;
    do c = next_char();
    while (c != ch_comment_close && c != ch_end_of_body && c != ch_end_of_input);
}

// Takes everything up to and including the line feed, so no end of line
// follows a line comment.
void skip_line_comment() {
    std::uint8_t c;
    do c = next_char();
    while (c != '\n' && c != ch_end_of_body && c != ch_end_of_input);
}

status_code scan() {
    if (push_back_flag == 1) {
        push_back_flag = 0;
        return tok.kind;
    }
    for (;;) {
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

status_code scan_token() {
    const status_code result = scan();
    char_source_store();  // keep the frame's read_pos true for the parser
    return result;
}

}  // namespace tplex
