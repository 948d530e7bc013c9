#include "dict/keywords.h"

#include <cstdio>

#include "base/text.h"
#include "dict/dictionary.h"
#include "tplex/services.h"

namespace tplex {

namespace {

// The reserved words in code order (the list of tplex/services.h): code
// equals index, and the order is part of the interface.
constexpr const char *reserved_words[] = {
#define TPLEX_RESERVED_WORD_SPELLING(name, spelling) spelling,
    TPLEX_RESERVED_WORD_LIST(TPLEX_RESERVED_WORD_SPELLING)
#undef TPLEX_RESERVED_WORD_SPELLING
};
static_assert(sizeof reserved_words / sizeof reserved_words[0] == reserved_word_count &&
              rw_code_count == reserved_word_count);

// The hash words in loading order (not code order).
struct hash_word {
    std::uint16_t code;
    const char *word;
};
constexpr hash_word hash_words[hash_word_count] = {
    {hw_define, "DEFINE"}, {hw_endif, "ENDIF"},     {hw_ifdef, "IFDEF"},
    {hw_ifndef, "IFNDEF"}, {hw_include, "INCLUDE"},
};

constexpr std::array<reserved_word_record, reserved_word_count> make_reserved_table() {
    std::array<reserved_word_record, reserved_word_count> table{};
    for (int code = 0; code < reserved_word_count; ++code) {
        table[code].code = static_cast<std::uint16_t>(code);
        for (int i = 0; reserved_words[code][i] != '\0'; ++i)
            table[code].word[i] = reserved_words[code][i];
    }
    return table;
}

static_assert(same_text(reserved_words[rw_protocol], "PROTOCOL") && rw_protocol == 0 &&
              same_text(reserved_words[rw_less_equal], "<=") && rw_less_equal == 39 &&
              same_text(reserved_words[rw_window], "WINDOW") && rw_window == 117);

// Inserts one keyword; a word already present is reported and overwritten.
// Neither the lookup's nor the insert's result is passed on: an insert that
// runs out of memory leaves the word out.
void add_keyword(std::uint8_t kind, std::uint16_t code, char *word, const char *duplicate) {
    if (dict_lookup(word) == 1) {
        std::fputs(duplicate, stdout);
        std::fflush(stdout);
    }
    dict_insert(kind, static_cast<std::int16_t>(code), word);
}

// The dictionary's lookup upper-cases its argument in place: each word is
// looked up as a copy, so the tables stay constant data, and the parser's
// table is not even read (its pages stay out of memory until the parser
// reads them).
void add_copy(void (*add)(std::uint16_t, char *), std::uint16_t code, const char *word) {
    char copy[32];
    copy_text(copy, sizeof copy, word);
    add(code, copy);
}

}  // namespace

// Built at compile time from the list above; writable, as the parser sees it.
std::array<reserved_word_record, reserved_word_count> reserved_word_table = make_reserved_table();

void add_reserved_word(std::uint16_t code, char *word) {
    add_keyword(tk_reserved_word, code, word, "\nReserved Word Duplicated");
}

void add_hash_word(std::uint16_t code, char *word) {
    add_keyword(tk_hash_word, code, word, "\nHash Directive Duplicated");
}

void load_keywords() {
    for (int code = 0; code < reserved_word_count; ++code)
        add_copy(add_reserved_word, static_cast<std::uint16_t>(code), reserved_words[code]);
    for (const hash_word &h : hash_words) add_copy(add_hash_word, h.code, h.word);
}

}  // namespace tplex
