// Initialisation, reset and release of the lexer's state, the keyword
// tables and the two exports without a subsystem of their own.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "dict/declarations.h"
#include "dict/dictionary.h"
#include "lex/keywords.h"
#include "lex/memory.h"
#include "lex/lexer.h"
#include "scan/char_source.h"
#include "scan/directives.h"
#include "source/source_stack.h"
#include "test_support.h"

namespace tplex {
namespace {

class Lexer : public ::testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(sc_lex_init(), 0); }
    void TearDown() override { ::lex_free(); }

    // The kind and value a lookup of word gives, as "kind/value".
    static std::string entry(std::string word) {
        if (dict_lookup(word.data()) != 1) return "absent";
        return std::to_string(current_token.kind) + "/" + std::to_string(current_token.value);
    }
};

TEST_F(Lexer, InitialisationLeavesTheLastKeywordInTheRecord) {
    EXPECT_EQ(current_token.kind, tk_hash_word);
    EXPECT_EQ(current_token.value, hw_include);
    EXPECT_STREQ(current_token.text, "INCLUDE");
    EXPECT_EQ(current_token.slot, 210);
}

TEST_F(Lexer, KeywordsAreLoadedWithTheirKindsAndCodes) {
    EXPECT_EQ(entry("PROTOCOL"), "9/0");
    EXPECT_EQ(entry("window"), "9/117");
    EXPECT_EQ(entry("<="), "9/39");
    EXPECT_EQ(entry("SequenceValidity"), "9/49");
    EXPECT_EQ(entry("IFNDEF"), "24/203");
    EXPECT_EQ(entry("define"), "24/201");
    EXPECT_EQ(entry("ENDIF"), "24/204");
    int count = 0;
    for (int s = 0; s < dict_slot_count; ++s) count += dict_slots[s] != nullptr;
    EXPECT_EQ(count, 123);
}

TEST_F(Lexer, ReservedWordTableHasTheParserVisibleLayout) {
    const auto *bytes = reinterpret_cast<const unsigned char *>(reserved_word_table.data());
    for (int code : {0, 39, 93, 117}) {
        const unsigned char *record = bytes + code * 2502;
        EXPECT_EQ(record[0] | (record[1] << 8), code);
        EXPECT_STREQ(reinterpret_cast<const char *>(record + 2), reserved_word_table[code].word);
    }
    EXPECT_STREQ(reserved_word_table[93].word, "SYSTEM");
    // The rest of each word's array is zero.
    EXPECT_EQ(reserved_word_table[0].word[2499], 0);
    EXPECT_EQ(reserved_word_table[0].word[8], 0);
}

TEST_F(Lexer, StartingValuesOfCountersAndFlags) {
    EXPECT_EQ(declare_enabled, 1);
    EXPECT_EQ(push_back_flag, 0);
    EXPECT_EQ(source_depth, 0);
    EXPECT_EQ(macro_depth, 0);
    EXPECT_EQ(cond_depth, 0);
    EXPECT_EQ(cond_stack[0], 1);
    EXPECT_EQ(include_dir_count, 0);
    EXPECT_EQ(next_ident_number(13), 1);
    EXPECT_EQ(next_ident_number(17), 2);
    // Frame 0 has a defined, empty position.
    EXPECT_STREQ(source_stack[0].path, "");
    EXPECT_STREQ(source_stack[0].line_text, "");
    EXPECT_EQ(source_stack[0].line_no + 1u, 0u);
    for (int d = 0; d < source_frame_count; ++d) EXPECT_EQ(source_stack[d].file, nullptr);
}

TEST_F(Lexer, DuplicateKeywordIsReportedOnceAndOverwritten) {
    char word[] = "PROTOCOL";
    test::CaptureStdout out;
    add_reserved_word(50, word);
    char hash[] = "ENDIF";
    add_hash_word(209, hash);
    EXPECT_EQ(out.text(), "\nReserved Word Duplicated\nHash Directive Duplicated");
    EXPECT_EQ(entry("PROTOCOL"), "9/50");
    EXPECT_EQ(entry("ENDIF"), "24/209");
}

TEST_F(Lexer, InitialisationPrintsNothing) {
    ::lex_free();
    test::CaptureStdout out;
    EXPECT_EQ(sc_lex_init(), 0);
    EXPECT_EQ(out.text(), "");
}

TEST_F(Lexer, ResetEmptiesTheDictionaryButKeepsTheStorage) {
    std::string name = "DECLARED";
    ASSERT_EQ(dict_lookup(name.data()), 0);
    ASSERT_EQ(dict_insert(20, next_ident_number(20), "DECLARED"), 0);
    next_ident_number(13);
    declare_enabled = 0;
    push_back_flag = 1;
    cond_depth = 3;
    include_dir_count = 4;
    auto *const slots = dict_slots;
    auto *const frames = source_stack;
    auto *const macros = macro_stack;

    lex_reset();
    EXPECT_EQ(entry("DECLARED"), "absent");
    EXPECT_EQ(entry("WINDOW"), "9/117");
    EXPECT_EQ(next_ident_number(13), 1);
    EXPECT_EQ(next_ident_number(20), 2);
    EXPECT_EQ(cond_depth, 0);
    EXPECT_EQ(include_dir_count, 0);
    EXPECT_EQ(declare_enabled, 0) << "kept";
    EXPECT_EQ(push_back_flag, 1) << "kept";
    EXPECT_EQ(dict_slots, slots);
    EXPECT_EQ(source_stack, frames);
    EXPECT_EQ(macro_stack, macros);
}

TEST_F(Lexer, SecondInitialisationStartsAfresh) {
    std::string name = "GONE";
    ASSERT_EQ(dict_lookup(name.data()), 0);
    ASSERT_EQ(dict_insert(20, 1, "GONE"), 0);
    EXPECT_EQ(sc_lex_init(), 0);
    EXPECT_EQ(entry("GONE"), "absent");
    EXPECT_EQ(entry("PROTOCOL"), "9/0");
}

TEST(LexerLifecycle, FreeWithoutInitialisationAndTwiceIsHarmless) {
    EXPECT_EQ(::lex_free(), 0);
    EXPECT_EQ(::lex_free(), 0);
    EXPECT_EQ(sc_lex_init(), 0);
    EXPECT_EQ(::lex_free(), 0);
    EXPECT_EQ(::lex_free(), 0);
    EXPECT_EQ(dict_slots, nullptr);
    EXPECT_EQ(source_stack, nullptr);
    EXPECT_EQ(macro_stack, nullptr);
}

TEST(LexerLifecycle, SetupWritesOnlyThroughNonNullPointers) {
    ::lex_free();
    EXPECT_EQ(sc_lex_setup(nullptr, nullptr, nullptr, nullptr, nullptr), 0);
    source_frame *frames = reinterpret_cast<source_frame *>(1);
    token_record *tok = nullptr;
    EXPECT_EQ(sc_lex_setup(&tok, &frames, nullptr, nullptr, nullptr), 0);
    EXPECT_EQ(frames, nullptr) << "no source stack before sc_lex_init";
    EXPECT_EQ(tok, &current_token);

    ASSERT_EQ(sc_lex_init(), 0);
    int16_t *depth = nullptr;
    reserved_word_record *words = nullptr;
    uint8_t *declare = nullptr;
    EXPECT_EQ(sc_lex_setup(nullptr, &frames, &depth, &words, &declare), 0);
    EXPECT_EQ(frames, source_stack);
    EXPECT_EQ(depth, &source_depth);
    EXPECT_EQ(words, reserved_word_table.data());
    EXPECT_EQ(declare, &declare_enabled);
    ::lex_free();
}

TEST(LexerLifecycle, ExportsAreSafeBeforeInitialisation) {
    ::lex_free();
    EXPECT_EQ(sc_next_token(), tk_end_of_input);
    EXPECT_EQ(::parse_ident(1, 20), TPLEX_IDENTIFIER_EXPECTED);
    EXPECT_EQ(::dict_extend("a", "b", "c", 0, 0, 0), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(::dict_check(), 0);
    char name[] = "x";
    char *names[] = {name};
    EXPECT_EQ(::sc_lex_init_defines(names, 1), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(::sg_closesources(), 0);
    EXPECT_EQ(::open_source_file("x"), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(::open_source_file(nullptr), TPLEX_NOT_INITIALISED);
}

#ifdef TPLEX_ALLOC_HOOK
TEST(LexerLifecycle, FailedInitialisationKeepsNothing) {
    for (unsigned long n = 1; n <= 3; ++n) {
        mem_fail_at(n);
        EXPECT_EQ(sc_lex_init(), TPLEX_MALLOC_FAILED) << n;
        mem_fail_at(0);
        EXPECT_EQ(dict_slots, nullptr);
        EXPECT_EQ(macro_stack, nullptr);
        EXPECT_EQ(source_stack, nullptr);
        EXPECT_EQ(::lex_free(), 0);
    }
}
#endif

}  // namespace
}  // namespace tplex
