// Prints the reserved words and hash words with their codes as the Markdown
// tables README.md shows, from the library itself: the reserved word table
// that sc_lex_setup hands the parser, and the hash words of the dictionary
// that sc_lex_init fills. readme_words.sh checks README.md against it.
//
//   word_table
#include <algorithm>
#include <cstdio>
#include <string>
#include <utility>
#include <vector>

#include "dict/dictionary.h"
#include "tplex/lexer.h"

int main() {
    reserved_word_record *words = nullptr;
    if (sc_lex_init() != 0) return 2;
    sc_lex_setup(nullptr, nullptr, nullptr, &words, nullptr);

    // The codes run down the columns, four pairs of columns wide.
    constexpr int columns = 4;
    constexpr int rows = (TPLEX_RESERVED_WORDS + columns - 1) / columns;
    std::printf("| Code | Word | Code | Word | Code | Word | Code | Word |\n");
    std::printf("|---:|---|---:|---|---:|---|---:|---|\n");
    for (int r = 0; r < rows; ++r) {
        for (int c = 0; c < columns; ++c) {
            const int code = c * rows + r;
            if (code < TPLEX_RESERVED_WORDS)
                std::printf("| %d | `%s` ", words[code].code, words[code].word);
            else
                std::printf("| | ");
        }
        std::printf("|\n");
    }

    std::vector<std::pair<int, std::string>> hash_words;
    for (int s = 0; s < tplex::dict_slot_count; ++s) {
        const tplex::dict_entry *e = tplex::dict_slots[s];
        if (e != nullptr && e->kind == tk_hash_word) hash_words.emplace_back(e->code, e->name);
    }
    std::sort(hash_words.begin(), hash_words.end());
    std::printf("\n| Code | Hash word |\n|---:|---|\n");
    for (const auto &[code, name] : hash_words) std::printf("| %d | `#%s` |\n", code, name.c_str());
    lex_free();
    return hash_words.size() == TPLEX_HASH_WORDS ? 0 : 1;
}
