#include "lex/keywords.h"

#include <cstdio>

#include "dict/dictionary.h"

namespace tplex {

namespace {

// The reserved words in code order: code equals index, and the order is
// part of the interface.
constexpr const char *reserved_words[reserved_word_count] = {
    "PROTOCOL",
    "PROCESS",
    "STATE",
    "NEXTSTATE",
    "INPUT",
    "UNDEFINED",
    "OUTPUT",
    "ALL",
    "INT",
    "BIT",
    "NIBBLE",
    "BYTE",
    "TEMPLATE",
    "TYPE",
    "MESSAGE",
    "MATCH",
    "GENERATE",
    "BLOCK",
    "SIGNAL",
    "SIGNALROUTE",
    "CONNECT",
    "ENDBLOCK",
    "START",
    "DCL",
    "ENDPROCESS",
    "ENDSTATE",
    "FROM",
    "ENV",
    "TO",
    "WITH",
    "TASK",
    "VIA",
    "AND",
    "BOOL",
    "STOP",
    "UINT",
    "UBYTE",
    "OR",
    "NOT",
    "<=",
    ">=",
    "/=",
    "TRUE",
    "FALSE",
    "XOR",
    "DECISION",
    "ELSE",
    "ENDDECISION",
    "INMSG",
    "SEQUENCEVALIDITY",
    "VALID",
    "INVALID",
    "UNKNOWN",
    "RECORDNUMBER",
    "PREVIOUSINSEQ",
    "SELECTCODE",
    "CHARSTRING",
    "NOCREATE",
    "PROCESSKEY",
    "JOIN",
    "LINK",
    "UNLINK",
    "PID",
    "SELF",
    "PARENT",
    "OFFSPRING",
    "SENDER",
    "SET",
    "ACTIVE",
    "RESET",
    "TIMER",
    "OUTMSG",
    "USE",
    "STANDARD",
    "TIME",
    "DURATION",
    "NOW",
    "TIMESTAMP",
    "EVENTTYPE",
    "EVENTSTATUS",
    "LENGTH",
    "JAN",
    "FEB",
    "MAR",
    "APR",
    "MAY",
    "JUN",
    "JUL",
    "AUG",
    "SEP",
    "OCT",
    "NOV",
    "DEC",
    "SYSTEM",
    "CHANNELROUTE",
    "CONTROL",
    "LOG",
    "STREAM",
    "USERINTERFACE",
    "ENDCHANNELROUTE",
    "REFERENCED",
    "IN",
    "ON",
    "PC",
    "DASS",
    "ENDSYSTEM",
    "CALLTRACEID",
    "DYNAMIC",
    "STATIC",
    "FIELD",
    "VALUE",
    "POSITION",
    "MASK",
    "CRC",
    "PROTECT",
    "SOURCE",
    "HEADER",
    "WINDOW",
};
static_assert(sizeof reserved_words / sizeof reserved_words[0] == 118);

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

constexpr bool same_word(const char *a, const char *b) {
    while (*a != '\0' && *a == *b) ++a, ++b;
    return *a == *b;
}
static_assert(same_word(reserved_words[0], "PROTOCOL") && same_word(reserved_words[39], "<=") &&
              same_word(reserved_words[117], "WINDOW"));

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
    std::snprintf(copy, sizeof copy, "%s", word);
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
