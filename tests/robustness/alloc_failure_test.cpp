// Allocation failures: every allocation of an operation is made to fail in
// turn (the test-only hook of base/memory.h). Each failure must give the
// operation's documented result, leave the state usable as documented, and
// leak nothing (the sanitizer build runs these under LeakSanitizer).
#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <string>

#include "base/memory.h"
#include "base/token.h"
#include "dict/dictionary.h"
#include "lex_harness.h"
#include "services/declarations.h"
#include "tplex/table_output.h"

namespace tplex::test {
namespace {

// For every allocation n that step makes when nothing fails: setup, step
// with allocation n failing, then check(result) with failures switched off.
void walk_failures(const std::function<void()> &setup, const std::function<status_code()> &step,
                   const std::function<void(status_code)> &check) {
    setup();
    mem_fail_at(0);
    step();
    const unsigned long total = mem_fail_at(0);
    ASSERT_GT(total, 0u);
    for (unsigned long n = 1; n <= total && !::testing::Test::HasFailure(); ++n) {
        SCOPED_TRACE("allocation " + std::to_string(n) + " of " + std::to_string(total));
        setup();
        mem_fail_at(n);
        const status_code r = step();
        mem_fail_at(0);
        check(r);
    }
    sg_closesources();
    lex_free();
}

// The passes below lex this file from the start (sc_lex_init first).
TempDir dir;
const std::string source = dir.write("main.src", "alpha beta\n");

void start_pass(const std::string &file = source) {
    sg_closesources();
    ASSERT_EQ(sc_lex_init(), 0);
    ASSERT_EQ(sc_lex_init_file(file.c_str()), 1);
}

// The kind of a name's entry, or -1 when absent.
int kind_of(std::string name) {
    return dict_lookup(name.data()) == 1 ? current_token.kind : -1;
}

// A failed table is "Malloc Failed" with nothing kept; a failed keyword is
// left out, the others are there.
TEST(AllocFailure, LexInitialise) {
    int tables_failed = 0;
    walk_failures([] { lex_free(); }, lex_initialise,
                  [&](status_code r) {
                      tables_failed += r == TPLEX_MALLOC_FAILED;
                      if (r == TPLEX_MALLOC_FAILED) {
                          EXPECT_EQ(sc_lex_init_file("x"), TPLEX_NOT_INITIALISED);
                          return;
                      }
                      ASSERT_EQ(r, 0);
                      int missing = 0;
                      for (const char *w :
                           {"PROTOCOL", "STATE", "WINDOW", "UINT", "DEFINE", "ENDIF", "INCLUDE"})
                          missing += kind_of(w) == -1;
                      EXPECT_LE(missing, 1);
                  });
    EXPECT_EQ(tables_failed, 3);  // slots, macro stack, source stack
}

// #define: "Malloc Failed", the dictionary as it was, the next line read as usual.
TEST(AllocFailure, Define) {
    for (const char *line :
         {"#define FLAG", "#define FLAG \"hi\" there", "#define X 5\nX\n#define FLAG 10"}) {
        SCOPED_TRACE(line);
        const std::string file = dir.write("define.src", std::string(line) + "\nFLAG last\n");
        auto setup = [&] {
            start_pass(file);
            if (line[8] == 'X') {
                EXPECT_EQ(next(), "n:5:5");
            }
        };
        walk_failures(setup, sc_next_token, [&](status_code r) {
            EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
            const std::string after = rest();  // the rest of the line may be read as tokens
            EXPECT_NE(after.find("id:FLAG id:LAST eof"), std::string::npos)
                << after;  // no body from elsewhere
        });
    }
}

// The name is not stored but its number is used up: BETA gets 3.
TEST(AllocFailure, ParseIdent) {
    for (std::uint8_t declare : {1, 0}) {
        walk_failures([] { start_pass(); }, [&] { return parse_ident(declare, 20); },
                      [&](status_code r) {
                          EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                          EXPECT_EQ(kind_of("ALPHA"), -1);
                          EXPECT_EQ(parse_ident(declare, 20), 0);
                          EXPECT_EQ(describe(0), declare ? "k20:3:BETA" : "k12:20:BETA");
                      });
    }
}

// The entry is left without a definition, whether or not it had one.
TEST(AllocFailure, DictExtend) {
    for (bool had_definition : {false, true}) {
        auto setup = [&] {
            start_pass();
            ASSERT_EQ(parse_ident(1, 20), 0);
            ASSERT_EQ(had_definition ? dict_extend("old", "", "", 1, 1, 1) : 0, 0);
        };
        walk_failures(
            setup, [] { return dict_extend("one", "two", "three", 1, 2, 3); },
            [](status_code r) {
                EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                EXPECT_EQ(kind_of("ALPHA"), 20);
                EXPECT_EQ(current_token.has_definition, 0);
            });
    }
}

TEST(AllocFailure, LabelsAndPredefinedNames) {
    walk_failures([] { start_pass(); }, [] { return make_label(42, 7, 1); },
                  [](status_code r) {
                      EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                      EXPECT_EQ(make_label(42, 7, 0), TPLEX_DISASTER);
                      EXPECT_EQ(make_label(42, 7, 1), 0);
                  });
    int failed_at = 0;  // the names before the failed one stay defined, it and those after are not
    auto define = [&] {
        char a[] = "one", b[] = "two", c[] = "three";
        char *names[] = {a, b, c};
        return sc_lex_init_defines(names, 3);
    };
    walk_failures([] { start_pass(); }, define,
                  [&](status_code r) {
                      EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                      int i = 0;
                      for (const char *name : {"ONE", "TWO", "THREE"})
                          EXPECT_EQ(kind_of(name), i++ < failed_at ? 25 : -1);
                      ++failed_at;
                  });
}

// Table output: a failed OpenOutput leaves no output open (its empty file
// stays); a failure inside an output closes its file, so CloseOutput
// refuses it and AbandonOutput deletes it.
TEST(AllocFailure, TableOutput) {
    const std::string file = dir.path() + "/t.tbl", long_text(9999, 's');
    walk_failures([] { AbandonOutput(1), FreeOutputTables(); },
                  [&] { return OpenOutput(file.c_str(), 0, 7); },
                  [&](status_code r) {
                      EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_TABLES);
                      EXPECT_EQ(AbandonOutput(1), TPLEX_OUT_NOT_OPEN);
                      EXPECT_TRUE(std::ifstream(file).good());
                  });
    std::uint32_t id = 0;
    const std::pair<std::function<status_code()>, status_code> cases[] = {
        {[&] { return WriteReference(&id, 0); }, TPLEX_OUT_NO_MEMORY_RELOC},
        {[] { return StoreString("x"); }, TPLEX_OUT_NO_MEMORY_RELOC},
        {[&] { return AddToStringStore(&id, long_text.c_str()); }, TPLEX_OUT_NO_MEMORY_CHUNK},
    };
    for (const auto &[op, code] : cases) {
        auto setup = [&] {
            AbandonOutput(1);
            ASSERT_EQ(OpenOutput(file.c_str(), TPLEX_OUT_ALIGN, 0), 0);
            ASSERT_EQ(StoreString("first"), 0);  // the store's chunk has bytes in it
        };
        walk_failures(setup, op, [&](status_code r) {
            EXPECT_EQ(r, code);
            EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);
            EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
            EXPECT_EQ(AbandonOutput(1), 0);
            EXPECT_FALSE(std::ifstream(file).good());
        });
    }
    // Memory output: a first chunk that cannot be had leaves memory output
    // off and the earlier image as it was; a further chunk is a failed byte.
    auto image = [] {
        FreeMemoryOutput(), StartMemoryOutput(), WriteUInt32(0), StopMemoryOutput();
    };
    walk_failures(image, StartMemoryOutput, [](status_code r) {
        EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_CHUNK);
        EXPECT_EQ(MemoryOutputSize(), 4u);
        EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);  // off, and no file open
    });
    walk_failures([] { FreeMemoryOutput(), StartMemoryOutput(), WriteUInt32(0), WriteUInt8(1); },
                  [] {
                      status_code r = 0;
                      for (int i = 0; i < 10000 && r == 0; ++i) r = WriteUInt8(2);
                      return r;
                  },
                  [](status_code r) {  // a further chunk is a failed byte
                      EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_CHUNK);
                      EXPECT_EQ(WriteUInt8(3), 0);
                  });
    FreeMemoryOutput(), AbandonOutput(1), FreeOutputTables();
}

}  // namespace
}  // namespace tplex::test
