// Allocation failures: every allocation of an operation fails in turn (the
// test-only hook of base/memory.h), giving the operation's documented result
// and a usable state; the sanitizer build checks that none leaks.
#include <gtest/gtest.h>

#include <fstream>
#include <functional>
#include <string>
#include <tuple>

#include "base/memory.h"
#include "base/token.h"
#include "dict/dictionary.h"
#include "services/declarations.h"
#include "test_support.h"
#include "tplex/table_output.h"

namespace tplex::test {
namespace {

std::string printed;  // on standard error by the last failing step

// For each allocation n that step makes: setup, step with allocation n
// failing (giving want, unless want is 0), check with failures switched off.
void walk_failures(const std::function<void()> &setup, const std::function<status_code()> &step,
                   status_code want, const std::function<void()> &check) {
    const unsigned long total = (setup(), mem_fail_at(0), step(), mem_fail_at(0));
    ASSERT_GT(total, 0u);
    for (unsigned long n = 1; n <= total && !::testing::Test::HasFailure(); ++n) {
        SCOPED_TRACE("allocation " + std::to_string(n) + " of " + std::to_string(total));
        Capture err(2);
        const status_code r = (setup(), mem_fail_at(n), step());
        mem_fail_at(0), printed = err.text();
        EXPECT_EQ(r, want == 0 ? r : want);
        check();
    }
    sg_closesources(), lex_free(), AbandonOutput(1), FreeOutputTables(), FreeMemoryOutput();
}

TempDir dir;
// A fresh pass over a file of the given text.
std::function<void()> pass(const std::string &text) {
    return [file = dir.write("main.src", text)] {
        sg_closesources(), sc_lex_init(), sc_lex_init_file(file.c_str());
    };
}

int kind_of(std::string name) {  // -1 when absent
    return dict_lookup(name.data()) == 1 ? current_token.kind : -1;
}

// A failed table is "Malloc Failed" with nothing kept; a failed keyword is left out.
TEST(AllocFailure, LexInitialise) {
    int tables_failed = 0;
    status_code r = 0;
    walk_failures(
        [] { lex_free(); }, [&] { return r = lex_initialise(); }, 0,
        [&] {
            const bool table = r == TPLEX_MALLOC_FAILED;
            int missing = 0;
            for (const char *w : {"PROTOCOL", "WINDOW", "UINT", "DEFINE", "INCLUDE"})
                missing += !table && kind_of(w) == -1;
            tables_failed += table;
            EXPECT_TRUE(table ? sc_lex_init_file("x") == TPLEX_NOT_INITIALISED : missing <= 1);
        });
    EXPECT_EQ(tables_failed, 3);  // slots, macro stack, source stack
}

// A failed #define leaves no name behind (none expands to a body from
// elsewhere); the next line is read as usual.
TEST(AllocFailure, Define) {
    for (const char *line : {"#define FLAG", "#define FLAG \"hi\" there"}) {  // X read first
        auto setup = pass(std::string("#define X 5\nX\n") + line + "\nFLAG last\n");
        walk_failures(
            [&] { setup(), next(); }, sc_next_token, TPLEX_MALLOC_FAILED,
            [] { EXPECT_PRED_FORMAT2(::testing::IsSubstring, "id:FLAG id:LAST eof", rest()); });
    }
}

// parse_ident: no name stored, its number used up (BETA gets 3); dict_extend: no
// definition; make_label: no label; sc_lex_init_defines: earlier names stay.
TEST(AllocFailure, Services) {
    for (std::uint8_t declare : {1, 0})
        walk_failures(
            pass("alpha beta"), [&] { return parse_ident(declare, 20); }, TPLEX_MALLOC_FAILED,
            [&] {
                EXPECT_EQ(kind_of("ALPHA"), -1);
                EXPECT_EQ(describe(parse_ident(declare, 20)),
                          declare ? "k20:3:BETA" : "k12:20:BETA");
            });
    auto declared = [setup = pass("alpha")] {
        setup(), parse_ident(1, 20), dict_extend("old", "", "", 1, 1, 1);
    };
    walk_failures(
        declared, [] { return dict_extend("one", "two", "three", 1, 2, 3); }, TPLEX_MALLOC_FAILED,
        [] { EXPECT_EQ(kind_of("ALPHA") == 20 ? current_token.has_definition : 9, 0); });
    walk_failures(
        pass(""), [] { return make_label(42, 7, 1); }, TPLEX_MALLOC_FAILED,
        [] { EXPECT_EQ(make_label(42, 7, 0), TPLEX_DISASTER); });
    auto define = [] {
        char a[] = "one", b[] = "two", c[] = "three", *names[] = {a, b, c};
        return sc_lex_init_defines(names, 3);
    };
    walk_failures(pass(""), define, TPLEX_MALLOC_FAILED, [failed_at = 0]() mutable {
        int defined = failed_at++;  // one allocation a name
        for (const char *n : {"ONE", "TWO", "THREE"})
            EXPECT_EQ(kind_of(n), defined-- > 0 ? 25 : -1);
    });
}

// A failed OpenOutput leaves no output open (its empty file stays); a failure inside an output
// closes its file (CloseOutput refuses, AbandonOutput deletes it) and prints its own message.
TEST(AllocFailure, TableOutput) {
    const std::string file = dir.path + "/t.tbl", p = "sg_TableOutput";
    const std::string opening[] = {p + ": Failed to malloc StringStore\n",
                                   p + ": Failed to malloc relocatables\n"};
    walk_failures([] { AbandonOutput(1); },
                  [&] { return OpenOutput(file.c_str(), TPLEX_OUT_DIAGNOSTICS, 7); },
                  TPLEX_OUT_NO_MEMORY_TABLES,
                  [&, n = 0]() mutable {
                      EXPECT_EQ(printed, opening[n++ % 2]);
                      EXPECT_EQ(AbandonOutput(1), TPLEX_OUT_NOT_OPEN);
                      EXPECT_TRUE(std::ifstream(file).good());
                  });
    std::uint32_t id = 0;
    const std::string long_text(9999, 's'),
        reloc = p + " (CreateReference): Failed to malloc reloc record\n";
    const std::tuple<std::function<status_code()>, status_code, std::string> cases[] = {
        {[&] { return WriteReference(&id, 0); }, TPLEX_OUT_NO_MEMORY_RELOC, reloc},
        {[] { return StoreString("x"); }, TPLEX_OUT_NO_MEMORY_RELOC, reloc},
        {[&] { return AddToStringStore(&id, long_text.c_str()); }, TPLEX_OUT_NO_MEMORY_CHUNK,
         p + " (StoreString): Failed to malloc StringStore\n"}};
    for (const auto &[op, code, message] : cases) {
        auto open = [&] {
            AbandonOutput(1), OpenOutput(file.c_str(), TPLEX_OUT_ALIGN | TPLEX_OUT_DIAGNOSTICS, 0),
                StoreString("first");
        };
        walk_failures(open, op, code, [&] {
            EXPECT_EQ(printed, message);
            EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);
            EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
            EXPECT_EQ(AbandonOutput(1), 0);
            EXPECT_FALSE(std::ifstream(file).good());
        });
    }
    auto img = [] { FreeMemoryOutput(), StartMemoryOutput(), WriteUInt32(0), StopMemoryOutput(); };
    walk_failures(img, StartMemoryOutput, TPLEX_OUT_NO_MEMORY_CHUNK, [] {
        EXPECT_EQ(MemoryOutputSize(), 4u);
        EXPECT_EQ(WriteUInt8(1), TPLEX_OUT_WRITE_FAILED);  // off, and no file open
    });
}

}  // namespace
}  // namespace tplex::test
