// Allocation failures: every allocation of an operation is made to fail in
// turn (the test-only hook of lex/memory.h). Each failure must give the
// operation's documented result, leave the state usable as documented, and
// leak nothing (the sanitizer build runs these under LeakSanitizer).
#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <string>
#include <vector>

#include "dict/declarations.h"
#include "dict/dictionary.h"
#include "lex/memory.h"
#include "test_support.h"
#include "tplex/lexer.h"
#include "tplex/table_output.h"

namespace {

using tplex::test::TempDir;

// Allocations that step makes when nothing fails, after setup.
unsigned long allocations_of(const std::function<void()> &setup,
                             const std::function<void()> &step) {
    setup();
    tplex::mem_fail_at(0);
    step();
    return tplex::mem_fail_at(0);
}

// For every allocation n that step makes: setup, step with allocation n
// failing, then check(n) with failures switched off again.
void walk_failures(const std::function<void()> &setup, const std::function<void()> &step,
                   const std::function<void(unsigned long)> &check) {
    const unsigned long total = allocations_of(setup, step);
    ASSERT_GT(total, 0u);
    const ::testing::TestResult &result =
        *::testing::UnitTest::GetInstance()->current_test_info()->result();
    for (unsigned long n = 1; n <= total; ++n) {
        const int parts = result.total_part_count();
        setup();
        tplex::mem_fail_at(n);
        step();
        tplex::mem_fail_at(0);
        check(n);
        if (result.total_part_count() != parts) {
            ADD_FAILURE() << "with allocation " << n << " of " << total << " failing";
            break;
        }
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
    for (int i = 0; i < 100; ++i) {
        const int32_t r = sc_next_token();
        results.push_back(r);
        if (r == tk_end_of_input) break;
    }
    return results;
}

void start_pass(const std::string &file) {
    sg_closesources();
    ASSERT_EQ(sc_lex_init(), 0);
    ASSERT_EQ(sc_lex_init_file(file.c_str()), 1);
}

// ---------------------------------------------------------------------------
// lex_initialise: a failed table is "Malloc Failed" with nothing kept (and
// lex_free safe); a failed keyword is left out without a word.

TEST(AllocFailure, LexInitialise) {
    int tables_failed = 0, keywords_failed = 0;
    lex_free();
    tplex::mem_fail_at(0);
    ASSERT_EQ(lex_initialise(), 0);
    const unsigned long total = tplex::mem_fail_at(0);
    ASSERT_EQ(keywords_present(), TPLEX_RESERVED_WORDS + TPLEX_HASH_WORDS);
    for (unsigned long n = 1; n <= total; ++n) {
        lex_free();
        tplex::mem_fail_at(n);
        const int32_t r = lex_initialise();
        tplex::mem_fail_at(0);
        if (r == TPLEX_MALLOC_FAILED) {
            ++tables_failed;
            EXPECT_EQ(sc_lex_init_file("x"), TPLEX_NOT_INITIALISED) << n;
            EXPECT_EQ(sc_next_token(), tk_end_of_input) << n;
        } else {
            ++keywords_failed;
            ASSERT_EQ(r, 0) << n;
            EXPECT_EQ(keywords_present(), TPLEX_RESERVED_WORDS + TPLEX_HASH_WORDS - 1) << n;
        }
        EXPECT_EQ(lex_free(), 0) << n;
        EXPECT_EQ(lex_free(), 0) << n;
    }
    EXPECT_EQ(tables_failed, 3);  // slots, macro stack, source stack
    EXPECT_EQ(keywords_failed, TPLEX_RESERVED_WORDS + TPLEX_HASH_WORDS);
    // And the library starts again whole.
    ASSERT_EQ(sc_lex_init(), 0);
    EXPECT_EQ(keywords_present(), TPLEX_RESERVED_WORDS + TPLEX_HASH_WORDS);
    lex_free();
}

// ---------------------------------------------------------------------------
// #define: each failure is reported as "Malloc Failed" and the dictionary is
// as it was; the lines after it are read as usual.

struct define_case {
    const char *line;  // the #define line
    const char *name;  // the name it defines
    int kind;          // its kind when the line succeeds
};

void check_define(const define_case &c) {
    SCOPED_TRACE(c.line);
    TempDir dir;
    const std::string file = dir.write("main.src", std::string(c.line) + "\nlast\n");
    std::vector<int32_t> normal;
    std::vector<int32_t> results;
    walk_failures([&] { start_pass(file); }, [&] { results = drain(); },
                  [&](unsigned long) {
                      ASSERT_FALSE(results.empty());
                      EXPECT_EQ(results.front(), TPLEX_MALLOC_FAILED);
                      EXPECT_EQ(kind_of(c.name), -1);
                      EXPECT_EQ(results.back(), tk_end_of_input);
                  });
    start_pass(file);
    normal = drain();
    EXPECT_EQ(kind_of(c.name), c.kind);
    EXPECT_EQ(normal, (std::vector<int32_t>{tk_new_identifier, tk_end_of_input}));
    sg_closesources();
    lex_free();
}

TEST(AllocFailure, Define) {
    check_define({"#define FLAG", "FLAG", tk_hash_definition});
    check_define({"#define MAX 10 + 2", "MAX", tk_macro});
    check_define({"#define GREETING \"hi\" there", "GREETING", tk_macro});
}

// The expansion of a #define that failed at its last allocation must not
// bring back a body from elsewhere.
TEST(AllocFailure, FailedDefineIsNotExpanded) {
    TempDir dir;
    const std::string file = dir.write("main.src", "#define OTHER 5\nOTHER\n#define MAX 10\nMAX\n");
    start_pass(file);
    EXPECT_EQ(sc_next_token(), tk_number);  // OTHER: its body, 5
    tplex::mem_fail_at(0);
    tplex::mem_fail_at(3);  // MAX: name copy, entry, then its definition
    const int32_t r = sc_next_token();
    tplex::mem_fail_at(0);
    EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
    EXPECT_EQ(sc_next_token(), tk_new_identifier);  // MAX is no name with a body
    sg_closesources();
    lex_free();
}

// ---------------------------------------------------------------------------
// parse_ident: "Malloc Failed", the name not stored, the number used up;
// the next identifier is declared as usual.

void check_parse_ident(uint8_t declare, int32_t next_value) {
    SCOPED_TRACE(declare ? "declare" : "use");
    TempDir dir;
    const std::string file = dir.write("main.src", "alpha beta\n");
    int32_t r = 0;
    walk_failures([&] { start_pass(file); }, [&] { r = parse_ident(declare, 20); },
                  [&](unsigned long) {
                      EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                      EXPECT_EQ(kind_of("ALPHA"), -1);
                      token_record *tok = nullptr;
                      sc_lex_setup(&tok, nullptr, nullptr, nullptr, nullptr);
                      EXPECT_EQ(parse_ident(declare, 20), 0);
                      EXPECT_EQ(tok->kind, declare ? 20 : tk_undeclared);
                      EXPECT_EQ(tok->value, next_value);
                  });
}

TEST(AllocFailure, ParseIdent) {
    check_parse_ident(1, 3);   // ALPHA's number 2 is used up: BETA gets 3
    check_parse_ident(0, 20);  // a use stores the class
}

// ---------------------------------------------------------------------------
// dict_extend: "Malloc Failed" and the entry without a definition.

void check_extend(bool had_definition) {
    SCOPED_TRACE(had_definition ? "replacing a definition" : "first definition");
    TempDir dir;
    const std::string file = dir.write("main.src", "alpha\n");
    int32_t r = 0;
    walk_failures(
        [&] {
            start_pass(file);
            ASSERT_EQ(parse_ident(1, 20), 0);
            if (had_definition) {
                ASSERT_EQ(dict_extend("old", "", "", 1, 1, 1), 0);
            }
        },
        [&] { r = dict_extend("one", "two", "three", 1, 2, 3); },
        [&](unsigned long) {
            EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
            token_record *tok = nullptr;
            sc_lex_setup(&tok, nullptr, nullptr, nullptr, nullptr);
            EXPECT_EQ(kind_of("ALPHA"), 20);
            EXPECT_EQ(tok->has_definition, 0);
            EXPECT_EQ(dict_extend("one", "two", "three", 1, 2, 3), 0);
            EXPECT_EQ(kind_of("ALPHA"), 20);
            EXPECT_STREQ(tok->def_text3, "three");
        });
}

TEST(AllocFailure, DictExtend) {
    check_extend(false);
    check_extend(true);
}

// ---------------------------------------------------------------------------
// make_label: "Malloc Failed" and no label; declaring it again works.

TEST(AllocFailure, MakeLabel) {
    TempDir dir;
    const std::string empty = dir.write("empty.src", "");
    int32_t r = 0;
    walk_failures([&] { start_pass(empty); }, [&] { r = tplex::make_label(42, 7, 1); },
                  [&](unsigned long) {
                      EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                      EXPECT_EQ(tplex::make_label(42, 7, 0), TPLEX_DISASTER);
                      EXPECT_EQ(tplex::make_label(42, 7, 1), 0);
                      EXPECT_EQ(tplex::make_label(42, 7, 0), 0);
                  });
}

// ---------------------------------------------------------------------------
// sc_lex_init_defines: a name that cannot be stored is "Malloc Failed"; the
// names before it stay defined, the failed one and those after it are not.

TEST(AllocFailure, InitDefines) {
    TempDir dir;
    const std::string empty = dir.write("empty.src", "");
    int32_t r = 0;
    walk_failures([&] { start_pass(empty); },
                  [&] {
                      char a[] = "one", b[] = "two", c[] = "three";
                      char *names[] = {a, b, c};
                      r = sc_lex_init_defines(names, 3);
                  },
                  [&](unsigned long n) {
                      EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                      const char *names[] = {"ONE", "TWO", "THREE"};
                      for (unsigned long i = 0; i < 3; ++i)
                          EXPECT_EQ(kind_of(names[i]), i + 1 < n ? tk_hash_definition : -1) << i;
                  });
}

}  // namespace

// ---------------------------------------------------------------------------
// Table output: each allocation that fails gives the module's code. A
// failed OpenOutput leaves no output open (its empty file stays); a failure
// inside an output closes its file, so CloseOutput refuses it and
// AbandonOutput deletes it.

namespace {

bool file_exists(const std::string &path) {
    return std::ifstream(path).good();
}

TEST(AllocFailure, OpenOutput) {
    TempDir dir;
    const std::string file = dir.path() + "/t.tbl";
    int32_t r = 0;
    walk_failures([] { FreeOutputTables(); }, [&] { r = OpenOutput(file.c_str(), 0, 7); },
                  [&](unsigned long) {
                      EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_TABLES);
                      EXPECT_EQ(AbandonOutput(1), TPLEX_OUT_NOT_OPEN);
                      EXPECT_TRUE(file_exists(file));
                      ASSERT_EQ(OpenOutput(file.c_str(), 0, 7), 0);
                      EXPECT_EQ(WriteUInt8(1), 0);
                      EXPECT_EQ(CloseOutput(), 0);
                  });
    FreeOutputTables();
}

// An operation inside an open output, failing with one code whichever of
// its allocations fails.
void check_inside_output(const char *what, const std::function<int32_t()> &op, int32_t code) {
    SCOPED_TRACE(what);
    TempDir dir;
    const std::string file = dir.path() + "/t.tbl";
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
            EXPECT_FALSE(file_exists(file));
        });
    AbandonOutput(1);
    FreeOutputTables();
}

TEST(AllocFailure, InsideOutput) {
    uint32_t id = 0;
    const std::string long_text(9999, 's');
    check_inside_output(
        "WriteReference", [&] { return WriteReference(&id, 0); }, TPLEX_OUT_NO_MEMORY_RELOC);
    check_inside_output(
        "StoreString", [] { return StoreString("x"); }, TPLEX_OUT_NO_MEMORY_RELOC);
    check_inside_output(
        "AddToStringStore, new chunk", [&] { return AddToStringStore(&id, long_text.c_str()); },
        TPLEX_OUT_NO_MEMORY_CHUNK);
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
            EXPECT_EQ(MemoryOutputSize(), 10000u);
            EXPECT_EQ(WriteUInt8(3), 0);
            EXPECT_EQ(MemoryOutputSize(), 10001u);
        });
    FreeMemoryOutput();
}

}  // namespace
