// Lifecycle: whole lives of the lexer (initialise, predefine, passes with
// includes and defines, close, free) and of table outputs must leave no file
// open and, under LeakSanitizer, no memory behind.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "test_support.h"
#include "tplex/lexer.h"
#include "tplex/table_output.h"

namespace {

using tplex::test::ChangeDir;
using tplex::test::TempDir;

int open_fds() {
    int n = 0;
    for (const auto &e : std::filesystem::directory_iterator("/proc/self/fd")) (void)e, ++n;
    return n;
}

// A program that includes a file that includes another, defines names on
// the way and switches regions on and off.
void write_program(const TempDir &dir) {
    dir.write("main.src",
              "#define MAX 10\n#include \"a.src\"\nPROTOCOL p MAX\n"
              "#ifdef FROM_B\nseen\n#endif\n#ifndef DEBUG\nhidden\n#endif\nlast \"s\" 'c'\n");
    dir.write("a.src", "#include \"b.src\"\nin_a MAX\n");
    dir.write("b.src", "#define FROM_B\nin_b <\"pdf\">\n");
}

// Results and texts of one pass, to the end of input.
std::vector<std::string> pass() {
    token_record *tok = nullptr;
    sc_lex_setup(&tok, nullptr, nullptr, nullptr, nullptr);
    std::vector<std::string> seen;
    for (int i = 0; i < 200; ++i) {
        const int32_t r = sc_next_token();
        seen.push_back(std::to_string(r) + ":" + (r == tk_end_of_input ? "" : tok->text));
        if (r == tk_end_of_input) break;
    }
    return seen;
}

// One life of two passes; returns the tokens of the first after checking
// that the second repeats them.
std::vector<std::string> life() {
    char debug[] = "debug";
    char *names[] = {debug};
    EXPECT_EQ(sc_lex_init(), 0);
    EXPECT_EQ(sc_lex_init_defines(names, 1), 0);
    EXPECT_EQ(sc_lex_init_file("main.src"), 1);
    const std::vector<std::string> first = pass();
    EXPECT_EQ(rewind_input(), 1);
    EXPECT_EQ(sc_lex_init_defines(names, 1), 0);
    EXPECT_EQ(pass(), first);
    dict_check();
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(lex_free(), 0);
    return first;
}

// Many lives, then closing in the middle of nested includes: every level
// is closed, and a rewind starts the main file again.
TEST(Lifecycle, LivesLeaveNothingOpen) {
    TempDir dir;
    write_program(dir);
    ChangeDir here(dir.path());
    const int fds = open_fds();
    const std::vector<std::string> expected = life();
    EXPECT_EQ(expected.size(), 12u) << ::testing::PrintToString(expected);
    for (int i = 0; i < 10; ++i) ASSERT_EQ(life(), expected) << "life " << i;
    EXPECT_EQ(open_fds(), fds);
    ASSERT_EQ(sc_lex_init(), 0);
    ASSERT_EQ(sc_lex_init(), 0);  // again without lex_free: no leak
    ASSERT_EQ(sc_lex_init_file("main.src"), 1);
    ASSERT_EQ(sc_next_token(), tk_new_identifier);  // IN_B, two includes deep
    EXPECT_EQ(open_fds(), fds + 3);
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(open_fds(), fds);
    EXPECT_EQ(rewind_input(), 1);
    EXPECT_EQ(pass().size(), 13u);  // DEBUG not predefined now: HIDDEN too
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(lex_free() + lex_free(), 0);
    EXPECT_EQ(open_fds(), fds);
}

// Table outputs of each ending (complete, abandoned, failed at close and
// abandoned), with and without freeing the tables in between.
TEST(Lifecycle, TableOutputsLeaveNothingOpen) {
    TempDir dir;
    const std::string kept = dir.path() + "/kept.tbl", dropped = dir.path() + "/dropped.tbl";
    const int fds = open_fds();
    for (int round = 0; round < 6; ++round) {
        uint32_t id = 0;
        ASSERT_EQ(OpenOutput(kept.c_str(), round % 2 == 0 ? 0 : TPLEX_OUT_HEX_TEXT, 5), 0);
        EXPECT_EQ(WriteReference(&id, 0) + StoreString("text"), 0);
        EXPECT_EQ(DefineReferenceHere(nullptr, id, 1) + CloseOutput(), 0);
        ASSERT_EQ(OpenOutput(dropped.c_str(), 0, 0), 0);
        EXPECT_EQ(StoreString("gone") + AbandonOutput(round % 3 == 0), 0);
        ASSERT_EQ(OpenOutput(dropped.c_str(), 0, 0), 0);
        EXPECT_EQ(WriteReference(&id, 0), 0);  // never defined
        EXPECT_EQ(CloseOutput(), TPLEX_OUT_UNDEFINED_REFERENCE);
        EXPECT_EQ(AbandonOutput(0), 0);
        EXPECT_FALSE(std::filesystem::exists(dropped));
        EXPECT_EQ(StartMemoryOutput() + WriteUInt32(1) + FreeMemoryOutput(), 0);
        EXPECT_EQ(round % 4 == 0 ? FreeOutputTables() : 0, 0);
    }
    EXPECT_TRUE(std::filesystem::exists(kept));
    EXPECT_EQ(FreeOutputTables() + FreeOutputTables(), 0);
    EXPECT_EQ(open_fds(), fds);
}

}  // namespace
