// The language's vocabulary: 118 reserved words and 5 hash words. The
// reserved words are also handed to the parser as a table of records in
// writable storage.
#ifndef TPLEX_DICT_KEYWORDS_H
#define TPLEX_DICT_KEYWORDS_H

#include <array>
#include <cstdint>

#include "base/limits.h"
#include "tplex/lexer.h"

namespace tplex {

// 118 records back to back, code equal to index.
extern std::array<reserved_word_record, reserved_word_count> reserved_word_table;

// Insert one word as kind 9 (24), printing "\nReserved Word Duplicated"
// ("\nHash Directive Duplicated") first when it is already present.
void add_reserved_word(std::uint16_t code, char *word);
void add_hash_word(std::uint16_t code, char *word);

// Loads both tables into the dictionary: reserved words as kind 9, then
// hash words as kind 24, each with its code.
void load_keywords();

}  // namespace tplex

#endif
