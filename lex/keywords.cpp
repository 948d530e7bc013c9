#include "lex/keywords.h"

#include <cstdio>

#include "dict/dictionary.h"

namespace tplex {

// Code equals index; the order is part of the interface.
reserved_word_record reserved_word_table[reserved_word_count] = {
    {0, "PROTOCOL"},
    {1, "PROCESS"},
    {2, "STATE"},
    {3, "NEXTSTATE"},
    {4, "INPUT"},
    {5, "UNDEFINED"},
    {6, "OUTPUT"},
    {7, "ALL"},
    {8, "INT"},
    {9, "BIT"},
    {10, "NIBBLE"},
    {11, "BYTE"},
    {12, "TEMPLATE"},
    {13, "TYPE"},
    {14, "MESSAGE"},
    {15, "MATCH"},
    {16, "GENERATE"},
    {17, "BLOCK"},
    {18, "SIGNAL"},
    {19, "SIGNALROUTE"},
    {20, "CONNECT"},
    {21, "ENDBLOCK"},
    {22, "START"},
    {23, "DCL"},
    {24, "ENDPROCESS"},
    {25, "ENDSTATE"},
    {26, "FROM"},
    {27, "ENV"},
    {28, "TO"},
    {29, "WITH"},
    {30, "TASK"},
    {31, "VIA"},
    {32, "AND"},
    {33, "BOOL"},
    {34, "STOP"},
    {35, "UINT"},
    {36, "UBYTE"},
    {37, "OR"},
    {38, "NOT"},
    {39, "<="},
    {40, ">="},
    {41, "/="},
    {42, "TRUE"},
    {43, "FALSE"},
    {44, "XOR"},
    {45, "DECISION"},
    {46, "ELSE"},
    {47, "ENDDECISION"},
    {48, "INMSG"},
    {49, "SEQUENCEVALIDITY"},
    {50, "VALID"},
    {51, "INVALID"},
    {52, "UNKNOWN"},
    {53, "RECORDNUMBER"},
    {54, "PREVIOUSINSEQ"},
    {55, "SELECTCODE"},
    {56, "CHARSTRING"},
    {57, "NOCREATE"},
    {58, "PROCESSKEY"},
    {59, "JOIN"},
    {60, "LINK"},
    {61, "UNLINK"},
    {62, "PID"},
    {63, "SELF"},
    {64, "PARENT"},
    {65, "OFFSPRING"},
    {66, "SENDER"},
    {67, "SET"},
    {68, "ACTIVE"},
    {69, "RESET"},
    {70, "TIMER"},
    {71, "OUTMSG"},
    {72, "USE"},
    {73, "STANDARD"},
    {74, "TIME"},
    {75, "DURATION"},
    {76, "NOW"},
    {77, "TIMESTAMP"},
    {78, "EVENTTYPE"},
    {79, "EVENTSTATUS"},
    {80, "LENGTH"},
    {81, "JAN"},
    {82, "FEB"},
    {83, "MAR"},
    {84, "APR"},
    {85, "MAY"},
    {86, "JUN"},
    {87, "JUL"},
    {88, "AUG"},
    {89, "SEP"},
    {90, "OCT"},
    {91, "NOV"},
    {92, "DEC"},
    {93, "SYSTEM"},
    {94, "CHANNELROUTE"},
    {95, "CONTROL"},
    {96, "LOG"},
    {97, "STREAM"},
    {98, "USERINTERFACE"},
    {99, "ENDCHANNELROUTE"},
    {100, "REFERENCED"},
    {101, "IN"},
    {102, "ON"},
    {103, "PC"},
    {104, "DASS"},
    {105, "ENDSYSTEM"},
    {106, "CALLTRACEID"},
    {107, "DYNAMIC"},
    {108, "STATIC"},
    {109, "FIELD"},
    {110, "VALUE"},
    {111, "POSITION"},
    {112, "MASK"},
    {113, "CRC"},
    {114, "PROTECT"},
    {115, "SOURCE"},
    {116, "HEADER"},
    {117, "WINDOW"},
};

// Loading order, not code order.
reserved_word_record hash_word_table[hash_word_count] = {
    {hw_define, "DEFINE"},
    {hw_endif, "ENDIF"},
    {hw_ifdef, "IFDEF"},
    {hw_ifndef, "IFNDEF"},
    {hw_include, "INCLUDE"},
};

namespace {

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

}  // namespace

void add_reserved_word(std::uint16_t code, char *word) {
    add_keyword(tk_reserved_word, code, word, "\nReserved Word Duplicated");
}

void add_hash_word(std::uint16_t code, char *word) {
    add_keyword(tk_hash_word, code, word, "\nHash Directive Duplicated");
}

void load_keywords() {
    for (reserved_word_record &r : reserved_word_table) add_reserved_word(r.code, r.word);
    for (reserved_word_record &r : hash_word_table) add_hash_word(r.code, r.word);
}

}  // namespace tplex
