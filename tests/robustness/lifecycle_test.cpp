// Lifecycle: many whole lives of the lexer (initialise, predefine, a pass
// with includes and defines, further passes, close, free) and of table
// outputs (opened, closed, abandoned, failed, freed) must leave no file open
// and, under LeakSanitizer, no memory behind; every pass over the same
// input must give the same tokens.
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

// One life; returns the tokens of its first pass after checking that the
// further passes repeat them.
std::vector<std::string> life(int passes) {
    EXPECT_EQ(sc_lex_init(), 0);
    char debug[] = "debug";
    char *names[] = {debug};
    EXPECT_EQ(sc_lex_init_defines(names, 1), 0);
    EXPECT_EQ(sc_lex_init_file("main.src"), 1);
    const std::vector<std::string> first = pass();
    EXPECT_EQ(parse_ident(1, 20), TPLEX_IDENTIFIER_EXPECTED);  // at the end
    for (int i = 1; i < passes; ++i) {
        EXPECT_EQ(rewind_input(), 1);
        EXPECT_EQ(sc_lex_init_defines(names, 1), 0);
        EXPECT_EQ(pass(), first) << "pass " << i + 1;
        dict_check();
    }
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(lex_free(), 0);
    return first;
}

TEST(Lifecycle, ManyLivesLeaveNothingOpen) {
    TempDir dir;
    write_program(dir);
    ChangeDir here(dir.path());
    const int fds = open_fds();
    const std::vector<std::string> expected = life(3);
    EXPECT_EQ(expected.back(), "5:");
    EXPECT_EQ(expected.size(), 12u) << ::testing::PrintToString(expected);
    for (int i = 0; i < 50; ++i) ASSERT_EQ(life(3), expected) << "life " << i;
    EXPECT_EQ(open_fds(), fds);
}

// Closing in the middle of nested includes closes every level; a rewind
// then starts the main file again.
TEST(Lifecycle, CloseInsideIncludesThenRewind) {
    TempDir dir;
    write_program(dir);
    ChangeDir here(dir.path());
    const int fds = open_fds();
    ASSERT_EQ(sc_lex_init(), 0);
    ASSERT_EQ(sc_lex_init_file("main.src"), 1);
    int16_t *depth = nullptr;
    sc_lex_setup(nullptr, nullptr, &depth, nullptr, nullptr);
    ASSERT_EQ(sc_next_token(), tk_new_identifier);  // IN_B, two includes deep
    EXPECT_EQ(*depth, 3);
    EXPECT_EQ(open_fds(), fds + 3);
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(open_fds(), fds);
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(rewind_input(), 1);
    EXPECT_EQ(pass().size(), 13u);  // DEBUG not predefined now: HIDDEN too
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(lex_free(), 0);
    EXPECT_EQ(open_fds(), fds);
}

// Initialising again without lex_free, and freeing twice or before any
// initialisation, neither leaks nor releases anything twice.
TEST(Lifecycle, RepeatedInitialiseAndFree) {
    EXPECT_EQ(lex_free(), 0);
    for (int i = 0; i < 20; ++i) EXPECT_EQ(lex_initialise(), 0);
    EXPECT_EQ(lex_free(), 0);
    EXPECT_EQ(lex_free(), 0);
    EXPECT_EQ(sc_lex_init(), 0);
    EXPECT_EQ(lex_free(), 0);
}

// One table output of each ending: complete, abandoned, failed at close
// and abandoned, with and without freeing the tables in between.
void table_outputs(const std::string &dir, int round) {
    const std::string kept = dir + "/kept.tbl", dropped = dir + "/dropped.tbl";
    uint32_t id = 0;
    ASSERT_EQ(OpenOutput(kept.c_str(), round % 2 == 0 ? 0 : TPLEX_OUT_HEX_TEXT, 5), 0);
    EXPECT_EQ(WriteReference(&id, 0), 0);
    EXPECT_EQ(StoreString("text"), 0);
    EXPECT_EQ(DefineReferenceHere(nullptr, id, 1), 0);
    EXPECT_EQ(WriteUInt32(7), 0);
    EXPECT_EQ(CloseOutput(), 0);
    EXPECT_TRUE(std::filesystem::exists(kept));

    ASSERT_EQ(OpenOutput(dropped.c_str(), 0, 0), 0);
    EXPECT_EQ(StoreString("gone"), 0);
    EXPECT_EQ(AbandonOutput(round % 3 == 0), 0);
    EXPECT_FALSE(std::filesystem::exists(dropped));

    ASSERT_EQ(OpenOutput(dropped.c_str(), 0, 0), 0);
    EXPECT_EQ(WriteReference(&id, 0), 0);  // never defined
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_UNDEFINED_REFERENCE);
    EXPECT_EQ(AbandonOutput(0), 0);
    EXPECT_FALSE(std::filesystem::exists(dropped));

    ASSERT_EQ(StartMemoryOutput(), 0);
    EXPECT_EQ(WriteUInt32(1), 0);
    EXPECT_EQ(FreeMemoryOutput(), 0);
    if (round % 4 == 0) {
        EXPECT_EQ(FreeOutputTables(), 0);
    }
}

TEST(Lifecycle, TableOutputsLeaveNothingOpen) {
    TempDir dir;
    const int fds = open_fds();
    for (int i = 0; i < 30; ++i) table_outputs(dir.path(), i);
    EXPECT_EQ(FreeOutputTables(), 0);
    EXPECT_EQ(FreeOutputTables(), 0);
    EXPECT_EQ(AbandonOutput(1), TPLEX_OUT_NOT_OPEN);
    EXPECT_EQ(open_fds(), fds);
}

}  // namespace
