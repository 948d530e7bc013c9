// Allocation failures: every allocation of an operation is made to fail in
// turn (the test-only hook of lex/memory.h). Each failure must give the
// operation's documented result, leave the state usable as documented, and
// leak nothing (the sanitizer build runs these under LeakSanitizer).
#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <string>
#include <vector>

#include "base/memory.h"
#include "dict/dictionary.h"
#include "services/declarations.h"
#include "test_support.h"
#include "tplex/lexer.h"
#include "tplex/table_output.h"

namespace {

using tplex::test::TempDir;

// For every allocation n that step makes when nothing fails: setup, step
// with allocation n failing, then check(n) with failures switched off.
void walk_failures(const std::function<void()> &setup, const std::function<void()> &step,
                   const std::function<void(unsigned long)> &check) {
    setup();
    tplex::mem_fail_at(0);
    step();
    const unsigned long total = tplex::mem_fail_at(0);
    ASSERT_GT(total, 0u);
    for (unsigned long n = 1; n <= total && !::testing::Test::HasFailure(); ++n) {
        SCOPED_TRACE("allocation " + std::to_string(n) + " of " + std::to_string(total));
        setup();
        tplex::mem_fail_at(n);
        step();
        tplex::mem_fail_at(0);
        check(n);
    }
    sg_closesources();
    lex_free();
}

// The dictionary's view of a name: its kind, or -1 when absent.
int kind_of(const std::string &name) {
    std::string copy = name;
    token_record *tok = nullptr;
    sc_lex_setup(&tok, nullptr, nullptr, nullptr, nullptr);
    return tplex::dict_lookup(copy.data()) == 1 ? tok->kind : -1;
}

int keywords_present() {
    static const char *const hash_words[] = {"DEFINE", "IFDEF", "IFNDEF", "ENDIF", "INCLUDE"};
    reserved_word_record *words = nullptr;
    sc_lex_setup(nullptr, nullptr, nullptr, &words, nullptr);
    int n = 0;
    for (int i = 0; i < TPLEX_RESERVED_WORDS; ++i) n += kind_of(words[i].word) == tk_reserved_word;
    for (const char *w : hash_words) n += kind_of(w) == tk_hash_word;
    return n;
}

// Tokens of the rest of the input, failures included, up to the end.
std::vector<int32_t> drain() {
    std::vector<int32_t> results;
    while (results.size() < 100 && (results.empty() || results.back() != tk_end_of_input))
        results.push_back(sc_next_token());
    return results;
}

void start_pass(const std::string &file) {
    sg_closesources();
    ASSERT_EQ(sc_lex_init(), 0);
    ASSERT_EQ(sc_lex_init_file(file.c_str()), 1);
}

// lex_initialise: a failed table is "Malloc Failed" with nothing kept (and
// lex_free safe); a failed keyword is left out without a word.
TEST(AllocFailure, LexInitialise) {
    const int all = TPLEX_RESERVED_WORDS + TPLEX_HASH_WORDS;
    int tables_failed = 0;
    int32_t r = 0;
    walk_failures([] { lex_free(); }, [&] { r = lex_initialise(); },
                  [&](unsigned long n) {
                      tables_failed += r == TPLEX_MALLOC_FAILED;
                      if (r == TPLEX_MALLOC_FAILED) {
                          EXPECT_EQ(sc_lex_init_file("x"), TPLEX_NOT_INITIALISED) << n;
                      } else {
                          ASSERT_EQ(r, 0) << n;
                          EXPECT_EQ(keywords_present(), all - 1) << n;
                      }
                      EXPECT_EQ(lex_free() + lex_free(), 0) << n;
                  });
    EXPECT_EQ(tables_failed, 3);  // slots, macro stack, source stack
    ASSERT_EQ(sc_lex_init(), 0);  // and the library starts again whole
    EXPECT_EQ(keywords_present(), all);
    lex_free();
}

// #define: each failure is reported as "Malloc Failed" and the dictionary is
// as it was; the lines after it are read as usual.
void check_define(const char *line, const char *name, int kind) {
    SCOPED_TRACE(line);
    TempDir dir;
    const std::string file = dir.write("main.src", std::string(line) + "\nlast\n");
    std::vector<int32_t> results;
    walk_failures([&] { start_pass(file); }, [&] { results = drain(); },
                  [&](unsigned long) {
                      ASSERT_FALSE(results.empty());
                      EXPECT_EQ(results.front(), TPLEX_MALLOC_FAILED);
                      EXPECT_EQ(kind_of(name), -1);
                      EXPECT_EQ(results.back(), tk_end_of_input);
                  });
    start_pass(file);
    EXPECT_EQ(drain(), (std::vector<int32_t>{tk_new_identifier, tk_end_of_input}));
    EXPECT_EQ(kind_of(name), kind);
    sg_closesources();
    lex_free();
}

TEST(AllocFailure, Define) {
    check_define("#define FLAG", "FLAG", tk_hash_definition);
    check_define("#define GREETING \"hi\" there", "GREETING", tk_macro);
}

// The expansion of a #define that failed at its last allocation must not
// bring back a body from elsewhere.
TEST(AllocFailure, FailedDefineIsNotExpanded) {
    TempDir dir;
    start_pass(dir.write("main.src", "#define OTHER 5\nOTHER\n#define MAX 10\nMAX\n"));
    EXPECT_EQ(sc_next_token(), tk_number);  // OTHER: its body, 5
    tplex::mem_fail_at(0);
    tplex::mem_fail_at(3);  // MAX: name copy, entry, then its definition
    EXPECT_EQ(sc_next_token(), TPLEX_MALLOC_FAILED);
    tplex::mem_fail_at(0);
    EXPECT_EQ(sc_next_token(), tk_new_identifier);  // MAX is no name with a body
    sg_closesources();
    lex_free();
}

// parse_ident, dict_extend, make_label and sc_lex_init_defines on a pass
// over `text`: each failure is "Malloc Failed", then check(n) sees the
// state it leaves and what works next.
void check_step(const char *text, const std::function<void()> &before,
                const std::function<int32_t()> &step,
                const std::function<void(unsigned long)> &check) {
    TempDir dir;
    const std::string file = dir.write("main.src", text);
    int32_t r = 0;
    walk_failures([&] { start_pass(file), before(); }, [&] { r = step(); },
                  [&](unsigned long n) {
                      EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                      check(n);
                  });
}

token_record *current_token() {
    token_record *tok = nullptr;
    sc_lex_setup(&tok, nullptr, nullptr, nullptr, nullptr);
    return tok;
}

// The name is not stored but its number is used up: BETA gets 3; a use
// stores the class.
TEST(AllocFailure, ParseIdent) {
    for (uint8_t declare : {1, 0}) {
        check_step(
            "alpha beta\n", [] {}, [&] { return parse_ident(declare, 20); },
            [&](unsigned long) {
                EXPECT_EQ(kind_of("ALPHA"), -1);
                EXPECT_EQ(parse_ident(declare, 20), 0);
                EXPECT_EQ(current_token()->kind, declare ? 20 : tk_undeclared);
                EXPECT_EQ(current_token()->value, declare ? 3 : 20);
            });
    }
}

// The entry is left without a definition, whether or not it had one.
TEST(AllocFailure, DictExtend) {
    for (bool had_definition : {false, true}) {
        check_step(
            "alpha\n",
            [&] {
                ASSERT_EQ(parse_ident(1, 20), 0);
                ASSERT_EQ(had_definition ? dict_extend("old", "", "", 1, 1, 1) : 0, 0);
            },
            [] { return dict_extend("one", "two", "three", 1, 2, 3); },
            [](unsigned long) {
                EXPECT_EQ(current_token()->has_definition, 0);
                EXPECT_EQ(dict_extend("one", "two", "three", 1, 2, 3), 0);
                EXPECT_EQ(kind_of("ALPHA"), 20);
                EXPECT_STREQ(current_token()->def_text3, "three");
            });
    }
}

TEST(AllocFailure, MakeLabel) {
    check_step(
        "", [] {}, [] { return tplex::make_label(42, 7, 1); },
        [](unsigned long) {
            EXPECT_EQ(tplex::make_label(42, 7, 0), TPLEX_DISASTER);
            EXPECT_EQ(tplex::make_label(42, 7, 1), 0);
            EXPECT_EQ(tplex::make_label(42, 7, 0), 0);
        });
}

// The names before the failed one stay defined, it and those after are not.
TEST(AllocFailure, InitDefines) {
    check_step(
        "", [] {},
        [] {
            char a[] = "one", b[] = "two", c[] = "three";
            char *names[] = {a, b, c};
            return sc_lex_init_defines(names, 3);
        },
        [](unsigned long n) {
            const char *names[] = {"ONE", "TWO", "THREE"};
            for (unsigned long i = 0; i < 3; ++i)
                EXPECT_EQ(kind_of(names[i]), i + 1 < n ? tk_hash_definition : -1) << i;
        });
}

// Table output: each allocation that fails gives the module's code. A
// failed OpenOutput leaves no output open (its empty file stays); a failure
// inside an output closes its file, so CloseOutput refuses it and
// AbandonOutput deletes it.
TEST(AllocFailure, OpenOutput) {
    TempDir dir;
    const std::string file = dir.path() + "/t.tbl";
    int32_t r = 0;
    walk_failures([] { AbandonOutput(1), FreeOutputTables(); },
                  [&] { r = OpenOutput(file.c_str(), 0, 7); },
                  [&](unsigned long) {
                      EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_TABLES);
                      EXPECT_EQ(AbandonOutput(1), TPLEX_OUT_NOT_OPEN);
                      EXPECT_TRUE(std::ifstream(file).good());
                      ASSERT_EQ(OpenOutput(file.c_str(), 0, 7), 0);
                      EXPECT_EQ(CloseOutput(), 0);
                  });
    FreeOutputTables();
}

TEST(AllocFailure, InsideOutput) {
    uint32_t id = 0;
    const std::string long_text(9999, 's');
    const std::pair<std::function<int32_t()>, int32_t> cases[] = {
        {[&] { return WriteReference(&id, 0); }, TPLEX_OUT_NO_MEMORY_RELOC},
        {[] { return StoreString("x"); }, TPLEX_OUT_NO_MEMORY_RELOC},
        {[&] { return AddToStringStore(&id, long_text.c_str()); }, TPLEX_OUT_NO_MEMORY_CHUNK},
    };
    TempDir dir;
    const std::string file = dir.path() + "/t.tbl";
    for (const auto &[op, code] : cases) {
        int32_t r = 0;
        walk_failures(
            [&] {
                AbandonOutput(1);
                ASSERT_EQ(OpenOutput(file.c_str(), TPLEX_OUT_ALIGN, 0), 0);
                ASSERT_EQ(StoreString("first"), 0);  // the store's chunk has bytes in it
            },
            [&] { r = op(); },
            [&](unsigned long) {
                EXPECT_EQ(r, code);
                EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);
                EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
                EXPECT_EQ(AbandonOutput(1), 0);
                EXPECT_FALSE(std::ifstream(file).good());
            });
    }
    AbandonOutput(1);
    FreeOutputTables();
}

// Memory output: a first chunk that cannot be had leaves memory output off
// and the earlier image as it was; a further chunk is a failed byte.
TEST(AllocFailure, MemoryOutput) {
    int32_t r = 0;
    walk_failures(
        [] {
            FreeMemoryOutput();
            ASSERT_EQ(StartMemoryOutput(), 0);
            ASSERT_EQ(WriteUInt32(0x01020304), 0);
            StopMemoryOutput();
        },
        [&] { r = StartMemoryOutput(); },
        [&](unsigned long) {
            EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_CHUNK);
            EXPECT_EQ(MemoryOutputSize(), 4u);
            EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);  // off, and no file open
        });
    walk_failures(
        [] {
            FreeMemoryOutput();
            ASSERT_EQ(StartMemoryOutput(), 0);
            for (int i = 0; i < 10000; ++i) ASSERT_EQ(WriteUInt8(1), 0);
        },
        [&] { r = WriteUInt8(2); },
        [&](unsigned long) {
            EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_CHUNK);
            EXPECT_EQ(WriteUInt8(3), 0);
            EXPECT_EQ(MemoryOutputSize(), 10001u);
        });
    FreeMemoryOutput();
}

}  // namespace
