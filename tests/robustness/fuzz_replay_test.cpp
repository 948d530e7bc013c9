// Replays inputs through the fuzz harnesses: the inputs that once made a
// target fail (tests/robustness/crashes/<target>/, kept after the fix) and
// the seed corpora (fuzz/corpus/<target>/). The harness aborts on any
// broken invariant; the sanitizer build adds memory errors and leaks.
#include <gtest/gtest.h>

#include <algorithm>
#include <cctype>
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

std::vector<std::string> inputs_of(const std::string &target) {
    std::vector<std::string> files;
    for (const fs::path &dir : {fs::path(TPLEX_SOURCE_DIR) / "tests/robustness/crashes" / target,
                                fs::path(TPLEX_SOURCE_DIR) / "fuzz/corpus" / target}) {
        std::error_code ec;
        for (const auto &e : fs::directory_iterator(dir, ec))
            if (e.is_regular_file()) files.push_back(e.path().string());
    }
    std::sort(files.begin(), files.end());
    return files;
}

std::string read_file(const std::string &path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

// "crashes/lexer/hang-x" becomes crashes_hang_x.
std::string case_name(const ::testing::TestParamInfo<std::string> &info) {
    const fs::path p(info.param);
    std::string name =
        p.parent_path().parent_path().filename().string() + "_" + p.filename().string();
    for (char &c : name)
        if (!std::isalnum(static_cast<unsigned char>(c))) c = '_';
    return name;
}

void replay(void (*harness)(const std::uint8_t *, std::size_t), const std::string &file) {
    const std::string data = read_file(file);
    tplex::test::CaptureStdout quiet;
    harness(reinterpret_cast<const std::uint8_t *>(data.data()), data.size());
}

class LexerReplay : public ::testing::TestWithParam<std::string> {};
class TableOutputReplay : public ::testing::TestWithParam<std::string> {};
class TableCheckReplay : public ::testing::TestWithParam<std::string> {};
class FileNamesReplay : public ::testing::TestWithParam<std::string> {};

TEST_P(LexerReplay, RunsClean) {
    replay(tplex::fuzz::run_lexer, GetParam());
}
TEST_P(TableOutputReplay, RunsClean) {
    replay(tplex::fuzz::run_table_output, GetParam());
}
TEST_P(TableCheckReplay, RunsClean) {
    replay(tplex::fuzz::run_table_check, GetParam());
}
TEST_P(FileNamesReplay, RunsClean) {
    replay(tplex::fuzz::run_file_names, GetParam());
}

INSTANTIATE_TEST_SUITE_P(Inputs, LexerReplay, ::testing::ValuesIn(inputs_of("lexer")), case_name);
INSTANTIATE_TEST_SUITE_P(Inputs, TableOutputReplay, ::testing::ValuesIn(inputs_of("table_output")),
                         case_name);
INSTANTIATE_TEST_SUITE_P(Inputs, TableCheckReplay, ::testing::ValuesIn(inputs_of("table_check")),
                         case_name);
INSTANTIATE_TEST_SUITE_P(Inputs, FileNamesReplay, ::testing::ValuesIn(inputs_of("file_names")),
                         case_name);

}  // namespace
