// Replays inputs through the fuzz harnesses: the inputs that once made a
// target fail (tests/robustness/crashes/<target>/, kept after the fix) and
// the seed corpora (fuzz/corpus/<target>/). The harness aborts on any
// broken invariant; the sanitizer build adds memory errors and leaks.
#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "file_names_harness.h"
#include "lexer_harness.h"
#include "table_harness.h"
#include "test_support.h"

namespace {

namespace fs = std::filesystem;
using Harness = void (*)(const std::uint8_t *, std::size_t);

void replay(const std::string &target, Harness harness) {
    std::vector<fs::path> files;
    for (const char *dir : {"tests/robustness/crashes/", "fuzz/corpus/"}) {
        std::error_code ec;
        for (const auto &e : fs::directory_iterator(fs::path(TPLEX_SOURCE_DIR) / dir / target, ec))
            if (e.is_regular_file()) files.push_back(e.path());
    }
    EXPECT_FALSE(files.empty()) << target;
    std::sort(files.begin(), files.end());
    for (const fs::path &file : files) {
        SCOPED_TRACE(file.string());
        std::ifstream in(file, std::ios::binary);
        const std::string data{std::istreambuf_iterator<char>(in),
                               std::istreambuf_iterator<char>()};
        tplex::test::Capture quiet;
        harness(reinterpret_cast<const std::uint8_t *>(data.data()), data.size());
    }
}

TEST(FuzzReplay, Lexer) {
    replay("lexer", tplex::fuzz::run_lexer);
}
TEST(FuzzReplay, TableOutput) {
    replay("table_output", tplex::fuzz::run_table_output);
}
TEST(FuzzReplay, TableCheck) {
    replay("table_check", tplex::fuzz::run_table_check);
}
TEST(FuzzReplay, FileNames) {
    replay("file_names", tplex::fuzz::run_file_names);
}

}  // namespace
