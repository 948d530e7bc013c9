// The language's vocabulary: 118 reserved words and 5 hash words, in the
// parser-visible record layout, in writable storage (loading passes each
// stored word to the dictionary's lookup, which upper-cases in place).
#ifndef TPLEX_LEX_KEYWORDS_H
#define TPLEX_LEX_KEYWORDS_H

#include <cstdint>

#include "lex/limits.h"
#include "tplex/lexer.h"

namespace tplex {

extern reserved_word_record reserved_word_table[reserved_word_count];
extern reserved_word_record hash_word_table[hash_word_count];

// Insert one word as kind 9 (24), printing "\nReserved Word Duplicated"
// ("\nHash Directive Duplicated") first when it is already present.
void add_reserved_word(std::uint16_t code, char *word);
void add_hash_word(std::uint16_t code, char *word);

// Loads both tables into the dictionary: reserved words as kind 9, then
// hash words as kind 24, each with its code.
void load_keywords();

}  // namespace tplex

#endif
