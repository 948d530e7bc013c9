// Whole lives of the lexer (initialise, predefine, passes with includes and
// defines, close, free) leave no file open and, under LeakSanitizer, no memory.
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "test_support.h"

namespace tplex::test {
namespace {

int open_fds() {
    int n = 0;
    for (const auto &e : std::filesystem::directory_iterator("/proc/self/fd")) (void)e, ++n;
    return n;
}

// One life of two passes over a file that includes a file that includes
// another; the tokens of the first pass, after checking the second repeats them.
std::string life() {
    char debug[] = "debug";
    char *names[] = {debug};
    EXPECT_EQ(sc_lex_init() + sc_lex_init_defines(names, 1), 0);
    EXPECT_EQ(sc_lex_init_file("main.src"), 1);
    const std::string first = rest();
    EXPECT_EQ(rewind_input() + sc_lex_init_defines(names, 1), 1);
    EXPECT_EQ(rest(), first);
    dict_check();
    EXPECT_EQ(sg_closesources() + lex_free(), 0);
    return first;
}

TEST(Lifecycle, LivesLeaveNothingOpen) {
    TempDir dir;
    dir.write(
        "main.src",
        "#define MAX 10\n#include \"a.src\"\nPROTOCOL MAX\n#ifndef DEBUG\nhidden\n#endif\nlast\n");
    dir.write("a.src", "#include \"b.src\"\nin_a\n");
    dir.write("b.src", "in_b <\"pdf\">\n");
    ChangeDir here(dir.path);
    const int fds = open_fds();
    const std::string tokens = "id:IN_B pdf:pdf id:IN_A rw:0 n:10:10 id:LAST eof";
    for (int i = 0; i < 10; ++i) ASSERT_EQ(life(), tokens) << "life " << i;
    EXPECT_EQ(open_fds(), fds);
    ASSERT_EQ(sc_lex_init() + sc_lex_init(), 0);  // again without lex_free: no leak
    ASSERT_EQ(sc_lex_init_file("main.src"), 1);
    ASSERT_EQ(next(), "id:IN_B");  // two includes deep
    EXPECT_EQ(open_fds(), fds + 3);
    EXPECT_EQ(sg_closesources(), 0);
    EXPECT_EQ(open_fds(), fds);
    EXPECT_EQ(rewind_input(), 1);
    EXPECT_EQ(rest(), "id:IN_B pdf:pdf id:IN_A rw:0 n:10:10 id:HIDDEN id:LAST eof");
    EXPECT_EQ(sg_closesources() + lex_free() + lex_free(), 0);
    EXPECT_EQ(open_fds(), fds);
}

}  // namespace
}  // namespace tplex::test
