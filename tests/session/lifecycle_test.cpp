// The lexer's state: initialisation, reset, release, the exports before any
// state, and whole lives that leave no file open and, under LSan, no memory.
#include "session/lifecycle.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "base/token.h"
#include "dict/dictionary.h"
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
    ASSERT_EQ(sc_lex_init(), 0);
    ASSERT_EQ((entry("DECLARED"), dict_insert(20, 1, "DECLARED")), 0);  // into the slot looked up
    declare_enabled = 0, push_back_flag = 1, cond_depth = 3, include_dir_count = 4;
    auto *const slots = dict_slots;
    lex_reset();
    EXPECT_EQ(entry("DECLARED") + " " + entry("WINDOW"), "absent 9/117");
    EXPECT_EQ(cond_depth + include_dir_count + (dict_slots != slots), 0);
    EXPECT_EQ(declare_enabled * 10 + push_back_flag, 1) << "kept";
    ASSERT_EQ(dict_insert(20, 1, "DECLARED"), 0);
    EXPECT_EQ(sc_lex_init(), 0);  // a second initialisation starts afresh as well
    EXPECT_EQ(entry("DECLARED"), "absent");
    EXPECT_EQ(::lex_free() + ::lex_free(), 0);
}

TEST(Lexer, ExportsAreSafeWithoutState) {
    source_frame *frames = reinterpret_cast<source_frame *>(1);
    token_record *tok = nullptr;
    EXPECT_EQ(::lex_free() + sc_lex_setup(&tok, &frames, nullptr, nullptr, nullptr), 0);
    EXPECT_EQ(frames, nullptr) << "no source stack before sc_lex_init";
    EXPECT_EQ(tok, &current_token);
    EXPECT_EQ(sc_next_token(), tk_end_of_input);
    EXPECT_EQ(::parse_ident(1, 20), TPLEX_IDENTIFIER_EXPECTED);
    EXPECT_EQ(::dict_check() + ::sg_closesources(), 0);
    char name[] = "x", *names[] = {name};
    for (status_code r : {::dict_extend("a", "b", "c", 0, 0, 0), ::sc_lex_init_defines(names, 1),
                          ::open_source_file("x"), ::rewind_input()})
        EXPECT_EQ(r, TPLEX_NOT_INITIALISED);
}

#ifndef _WIN32  // open files counted in /proc/self/fd
int open_fds() {
    namespace fs = std::filesystem;
    return int(std::distance(fs::directory_iterator("/proc/self/fd"), fs::directory_iterator()));
}

// Lives over a file that includes a file that includes another.
TEST(Lifecycle, LivesLeaveNothingOpen) {
    test::TempDir dir;
    dir.write("main.src",
              "#define M 10\n#include \"a.src\"\nPROTOCOL M\n#ifndef DEBUG\nh\n#endif\nz\n");
    dir.write("a.src", "#include \"b.src\"\nin_a\n"), dir.write("b.src", "in_b <\"pdf\">\n");
    test::ChangeDir here(dir.path);
    const int fds = open_fds();
    char debug[] = "debug", *names[] = {debug};
    for (int i = 0; i < 10; ++i) {  // lives of two passes each
        EXPECT_EQ(sc_lex_init() + sc_lex_init_defines(names, 1) + sc_lex_init_file("main.src"), 1);
        for (int pass = 0; pass < 2; ++pass, rewind_input(), sc_lex_init_defines(names, 1))
            ASSERT_EQ(test::rest(), "id:IN_B pdf:pdf id:IN_A rw:0 n:10:10 id:Z eof") << i;
        dict_check();
        EXPECT_EQ(sg_closesources() + lex_free(), 0);
    }
    EXPECT_EQ(open_fds(), fds);
    ASSERT_EQ(sc_lex_init() + sc_lex_init() + sc_lex_init_file("main.src"), 1);  // no lex_free
    ASSERT_EQ(test::next(), "id:IN_B");  // two includes deep
    EXPECT_EQ(open_fds(), fds + 3);
    EXPECT_EQ(sg_closesources() + open_fds(), fds);
    EXPECT_EQ(rewind_input(), 1);
    EXPECT_EQ(test::rest(), "id:IN_B pdf:pdf id:IN_A rw:0 n:10:10 id:H id:Z eof");
    EXPECT_EQ(sg_closesources() + lex_free() + lex_free() + open_fds(), fds);
}
#endif

}  // namespace
}  // namespace tplex
