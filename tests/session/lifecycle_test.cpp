// The lexer's state: initialisation, reset between passes, release, and the
// exports called before there is any state.
#include "session/lifecycle.h"

#include <gtest/gtest.h>

#include <string>

#include "base/token.h"
#include "dict/dictionary.h"
#include "dict/keywords.h"
#include "scan/directives.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "source/source_stack.h"
#include "test_support.h"

namespace tplex {
namespace {

std::string entry(std::string word) {
    if (dict_lookup(word.data()) != 1) return "absent";
    return std::to_string(current_token.kind) + "/" + std::to_string(current_token.value);
}

TEST(Lexer, ResetEmptiesTheDictionaryButKeepsTheStorage) {
    test::Capture out;
    ASSERT_EQ(sc_lex_init(), 0);
    EXPECT_EQ(out.text(), "") << "initialisation prints nothing";
    entry("DECLARED");
    ASSERT_EQ(dict_insert(20, next_ident_number(20), "DECLARED"), 0);
    next_ident_number(13);
    declare_enabled = 0, push_back_flag = 1, cond_depth = 3, include_dir_count = 4;
    auto *const slots = dict_slots;
    lex_reset();
    EXPECT_EQ(entry("DECLARED") + " " + entry("WINDOW"), "absent 9/117");
    EXPECT_EQ(next_ident_number(13) * 10 + next_ident_number(20), 12);
    EXPECT_EQ(cond_depth + include_dir_count, 0);
    EXPECT_EQ(declare_enabled * 10 + push_back_flag, 1) << "kept";
    EXPECT_EQ(dict_slots, slots);
    ASSERT_EQ(dict_insert(20, 1, "DECLARED"), 0);
    EXPECT_EQ(sc_lex_init(), 0);  // a second initialisation starts afresh as well
    EXPECT_EQ(entry("DECLARED"), "absent");
    char word[] = "PROTOCOL", hash[] = "ENDIF";
    test::Capture duplicates;
    add_reserved_word(50, word);
    add_hash_word(209, hash);
    EXPECT_EQ(duplicates.text(), "\nReserved Word Duplicated\nHash Directive Duplicated");
    EXPECT_EQ(entry("PROTOCOL") + " " + entry("ENDIF"), "9/50 24/209");
    EXPECT_EQ(::lex_free() + ::lex_free(), 0);
}

TEST(Lexer, ExportsAreSafeWithoutState) {
    EXPECT_EQ(::lex_free(), 0);
    source_frame *frames = reinterpret_cast<source_frame *>(1);
    token_record *tok = nullptr;
    EXPECT_EQ(sc_lex_setup(&tok, &frames, nullptr, nullptr, nullptr), 0);
    EXPECT_EQ(frames, nullptr) << "no source stack before sc_lex_init";
    EXPECT_EQ(tok, &current_token);
    EXPECT_EQ(sc_next_token(), tk_end_of_input);
    EXPECT_EQ(::parse_ident(1, 20), TPLEX_IDENTIFIER_EXPECTED);
    EXPECT_EQ(::dict_extend("a", "b", "c", 0, 0, 0), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(::dict_check() + ::sg_closesources(), 0);
    char name[] = "x";
    char *names[] = {name};
    EXPECT_EQ(::sc_lex_init_defines(names, 1), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(::open_source_file("x"), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(::rewind_input(), TPLEX_NOT_INITIALISED);
}

}  // namespace
}  // namespace tplex
