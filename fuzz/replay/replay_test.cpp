// Replays through the fuzz harnesses the inputs that once made a target fail
// (fuzz/regressions/<target>/, kept after the fix) and the seed
// corpora (fuzz/corpus/<target>/). A harness aborts on any broken invariant;
// the sanitizer build adds memory errors and leaks.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "file_names_harness.h"
#include "lexer_harness.h"
#include "table_harness.h"
#include "test_support.h"

namespace {

void replay(const std::string &target, void (*harness)(const std::uint8_t *, std::size_t)) {
    int inputs = 0;
    for (const char *dir : {"fuzz/regressions/", "fuzz/corpus/"}) {
        std::error_code ec;
        for (const auto &e :
             std::filesystem::directory_iterator(TPLEX_SOURCE_DIR "/" + (dir + target), ec)) {
            SCOPED_TRACE(e.path().string());
            std::ifstream in(e.path(), std::ios::binary);
            const std::string data{std::istreambuf_iterator<char>(in),
                                   std::istreambuf_iterator<char>()};
            tplex::test::Capture quiet;
            harness(reinterpret_cast<const std::uint8_t *>(data.data()), data.size());
            ++inputs;
        }
    }
    EXPECT_GT(inputs, 0) << target;
}

TEST(FuzzReplay, EveryTarget) {
    replay("lexer", tplex::fuzz::run_lexer);
    replay("table_output", tplex::fuzz::run_table_output);
    replay("table_check", tplex::fuzz::run_table_check);
    replay("file_names", tplex::fuzz::run_file_names);
}

}  // namespace
