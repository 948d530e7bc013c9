// Allocation failures: every allocation of an operation is made to fail in
// turn (the test-only hook of base/memory.h). Each must give the operation's
// documented result and leave the state usable as documented; the sanitizer
// build checks that none leaks.
#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <string>

#include "base/memory.h"
#include "base/token.h"
#include "dict/dictionary.h"
#include "services/declarations.h"
#include "test_support.h"
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
    sg_closesources(), lex_free(), AbandonOutput(1), FreeOutputTables(), FreeMemoryOutput();
}

TempDir dir;

// A fresh pass over a file of the given text.
std::function<void()> pass(const std::string &text) {
    const std::string file = dir.write("main.src", text);
    return [file] {
        sg_closesources();
        ASSERT_EQ(sc_lex_init(), 0);
        ASSERT_EQ(sc_lex_init_file(file.c_str()), 1);
    };
}

int kind_of(std::string name) {  // -1 when absent
    return dict_lookup(name.data()) == 1 ? current_token.kind : -1;
}

// A failed table is "Malloc Failed" with nothing kept; a failed keyword is left out.
TEST(AllocFailure, LexInitialise) {
    int tables_failed = 0;
    walk_failures([] { lex_free(); }, lex_initialise,
                  [&](status_code r) {
                      tables_failed += r == TPLEX_MALLOC_FAILED;
                      if (r == TPLEX_MALLOC_FAILED) {
                          EXPECT_EQ(sc_lex_init_file("x"), TPLEX_NOT_INITIALISED);
                          return;
                      }
                      int missing = 0;
                      for (const char *w : {"PROTOCOL", "WINDOW", "UINT", "DEFINE", "INCLUDE"})
                          missing += kind_of(w) == -1;
                      EXPECT_LE(missing, 1);
                  });
    EXPECT_EQ(tables_failed, 3);  // slots, macro stack, source stack
}

// #define: "Malloc Failed", no name left behind (none expands to a body
// from elsewhere), the next line read as usual.
TEST(AllocFailure, Define) {
    for (const char *line : {"#define FLAG", "#define FLAG \"hi\" there"}) {  // X read first
        auto setup = pass(std::string("#define X 5\nX\n") + line + "\nFLAG last\n");
        walk_failures([&] { setup(), next(); }, sc_next_token,
                      [&](status_code r) {
                          EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                          const std::string after = rest();
                          EXPECT_NE(after.find("id:FLAG id:LAST eof"), std::string::npos) << after;
                      });
    }
}

// parse_ident: the name is not stored but its number is used up (BETA gets
// 3); dict_extend: the entry is left without a definition; make_label: no
// label; sc_lex_init_defines: the names before the failed one stay defined.
TEST(AllocFailure, Services) {
    for (std::uint8_t declare : {1, 0}) {
        walk_failures(
            pass("alpha beta"), [&] { return parse_ident(declare, 20); },
            [&](status_code r) {
                EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
                EXPECT_EQ(kind_of("ALPHA"), -1);
                EXPECT_EQ(parse_ident(declare, 20), 0);
                EXPECT_EQ(describe(0), declare ? "k20:3:BETA" : "k12:20:BETA");
            });
    }
    auto declared = [setup = pass("alpha")] {
        setup(), parse_ident(1, 20), dict_extend("old", "", "", 1, 1, 1);
    };
    walk_failures(
        declared, [] { return dict_extend("one", "two", "three", 1, 2, 3); },
        [](status_code r) {
            EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
            EXPECT_EQ(kind_of("ALPHA") * 10 + current_token.has_definition, 200);
        });
    walk_failures(
        pass(""), [] { return make_label(42, 7, 1); },
        [](status_code r) {
            EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
            EXPECT_EQ(make_label(42, 7, 0), TPLEX_DISASTER);
        });
    int failed_at = 0;
    auto define = [] {
        char a[] = "one", b[] = "two", c[] = "three";
        char *names[] = {a, b, c};
        return sc_lex_init_defines(names, 3);
    };
    walk_failures(pass(""), define, [&](status_code r) {
        EXPECT_EQ(r, TPLEX_MALLOC_FAILED);
        int i = 0;
        for (const char *name : {"ONE", "TWO", "THREE"})
            EXPECT_EQ(kind_of(name), i++ < failed_at ? 25 : -1);
        ++failed_at;
    });
}

// A failed OpenOutput leaves no output open (its empty file stays); a
// failure inside an output closes its file, so CloseOutput refuses it and
// AbandonOutput deletes it; memory output stays off.
TEST(AllocFailure, TableOutput) {
    const std::string file = dir.path + "/t.tbl";
    walk_failures([] { AbandonOutput(1); }, [&] { return OpenOutput(file.c_str(), 0, 7); },
                  [&](status_code r) {
                      EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_TABLES);
                      EXPECT_EQ(AbandonOutput(1), TPLEX_OUT_NOT_OPEN);
                      EXPECT_TRUE(std::ifstream(file).good());
                  });
    std::uint32_t id = 0;
    const std::string long_text(9999, 's');
    const std::pair<std::function<status_code()>, status_code> cases[] = {
        {[&] { return WriteReference(&id, 0); }, TPLEX_OUT_NO_MEMORY_RELOC},
        {[] { return StoreString("x"); }, TPLEX_OUT_NO_MEMORY_RELOC},
        {[&] { return AddToStringStore(&id, long_text.c_str()); }, TPLEX_OUT_NO_MEMORY_CHUNK}};
    for (const auto &[op, code] : cases) {
        auto open = [&] { AbandonOutput(1), OpenOutput(file.c_str(), 1, 0), StoreString("first"); };
        walk_failures(open, op, [&](status_code r) {
            EXPECT_EQ(r, code);
            EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);
            EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
            EXPECT_EQ(AbandonOutput(1), 0);
            EXPECT_FALSE(std::ifstream(file).good());
        });
    }
    auto image = [] {
        FreeMemoryOutput(), StartMemoryOutput(), WriteUInt32(0), StopMemoryOutput();
    };
    walk_failures(image, StartMemoryOutput, [](status_code r) {
        EXPECT_EQ(r, TPLEX_OUT_NO_MEMORY_CHUNK);
        EXPECT_EQ(MemoryOutputSize(), 4u);
        EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);  // off, and no file open
    });
}

}  // namespace
}  // namespace tplex::test
