// The source stack over real files in a temporary folder.
#include "source/source_stack.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstring>
#include <string>

#include "scan/char_source.h"
#include "test_support.h"

namespace tplex {
namespace {

TEST(AbsolutePath, DrivePathsAndLeadingSeparators) {
#ifdef _WIN32
    const bool posix = false;  // "/x" is absolute on a POSIX host only
#else
    const bool posix = true;
#endif
    // clang-format off
    const std::pair<const char *, bool> cases[] = {
        {"D:\\a", false} /* a drive path needs 5 characters */, {"D:\\ab", true}, {"z:\\ab", true},
        {"\\x", true}, {"/x", posix}, {"d:/x/y", false}, {"1:\\abc", false}, {"D:abcd", false},
        {"a\\b\\c", false}, {"", false}};
    // clang-format on
    for (auto [path, absolute] : cases) EXPECT_EQ(is_absolute_path(path), absolute) << path;
}

// Opens in a session whose folder is the current directory.
class SourceStack : public ::testing::Test {
protected:
    SourceStack() : cd_(s_.dir.path) {}
    void write(const std::string &name) { s_.dir.write(name, name + "\n"); }
    void dirs(std::initializer_list<const char *> list) {
        for (const char *d : list) ASSERT_EQ(add_include_dir(d), TPLEX_OK) << d;
    }
    // A refused open leaves every frame as it was, except that the next one
    // (made to look used) is left at position 0, with no line and no file.
    void expect_refused(const std::string &name, status_code code) {
        const int16_t depth = source_depth;
        source_frame *failed = depth < max_source_depth ? &source_stack[depth + 1] : nullptr;
        if (failed != nullptr) failed->read_pos = 7, failed->line_no = 3, failed->file = stderr;
        const std::string before(reinterpret_cast<char *>(source_stack),
                                 sizeof(source_frame) * source_frame_count);
        EXPECT_EQ(open_source_file(name.c_str()), code) << name;
        EXPECT_EQ(source_depth, depth);
        if (failed != nullptr && code != TPLEX_TOO_MANY_INCLUDE_LEVELS) {
            EXPECT_EQ(failed->read_pos + failed->line_no + 1 + !!failed->file, 0u) << name;
            failed->read_pos = 7, failed->line_no = 3, failed->file = stderr;
        }
        EXPECT_EQ(std::memcmp(before.data(), source_stack, before.size()), 0) << name;
        if (failed != nullptr) failed->file = nullptr;  // not to be closed
    }
    // An open as the next depth: the path it was opened under, no line yet,
    // and the file's first line (when given) read from its stream.
    void expect_opened(const std::string &name, const std::string &path,
                       const std::string &line = "") {
        const int16_t depth = static_cast<int16_t>(source_depth + 1);
        std::strcpy(source_stack[depth].line_text, "left by an earlier file\n");
        EXPECT_EQ(open_source_file(name.c_str()), depth) << name;
        const source_frame &f = source_stack[depth];
        EXPECT_EQ(f.path + std::to_string(f.read_pos + f.line_no + 1) + f.line_text, path + "0");
        char first[256] = "";
        EXPECT_EQ(line.empty() ? first : std::fgets(first, sizeof first, f.file), first);
        EXPECT_EQ(first, line);
    }

    test::LexSession s_;
    test::ChangeDir cd_;
};

TEST_F(SourceStack, OpensWithoutIncludeDirectories) {
    write("main.src"), write("sub/inc.src"), write(std::string(200, 'r'));
    const std::string abs = s_.dir.path + "/main.src";
    expect_opened("main.src", "main.src");
    expect_opened("sub\\inc.src", "sub\\inc.src", "sub/inc.src\n");  // opened with "/"
    expect_opened(abs, abs);
    expect_refused("none.src", TPLEX_NO_INCLUDE_DIRS);
    expect_refused(s_.dir.path + "/none.src", TPLEX_CANNOT_OPEN_SOURCE);
    expect_refused(std::string(200, 'r'), TPLEX_NO_INCLUDE_DIRS);  // too long for a frame: not cut
}

TEST_F(SourceStack, SearchesIncludeDirectoriesInOrder) {
    for (const char *f : {"inc/both.src", "lib/both.src", "lib/only.src", "cwd.src",
                          "inc/dir.src/x", "lib/dir.src"})
        write(f);
    dirs({"inc", "lib"});
    expect_opened("only.src", "lib\\only.src");
    expect_opened("both.src", "inc\\both.src", "inc/both.src\n");
    expect_opened("dir.src", "lib\\dir.src");
    expect_refused("cwd.src", TPLEX_CANNOT_OPEN_SOURCE);  // the current directory is not searched
    dirs({"lib\\", "."});
    expect_opened("cwd.src", ".\\cwd.src");            // one backslash always
    EXPECT_EQ(rewind_input() + include_dir_count, 1);  // the main file again, as it was found
    EXPECT_EQ(test::next(), "id:LIB");
}

TEST_F(SourceStack, LimitsAndClosing) {
    write("a.src");
    for (int depth = 1; depth <= 19; ++depth) ASSERT_EQ(open_source_file("a.src"), depth);
    expect_refused("a.src", TPLEX_TOO_MANY_INCLUDE_LEVELS);
    ::close(fileno(source_stack[2].file));  // the stream's close will fail
    EXPECT_EQ(close_sources(), TPLEX_CLOSE_FAILED);
    EXPECT_EQ(source_depth, 19);  // closing leaves the depth alone
    for (int i = 0; i < source_frame_count; ++i) EXPECT_EQ(source_stack[i].file, nullptr);
    EXPECT_EQ(close_sources(), TPLEX_OK);
    for (int i = 0; i < 9; ++i)
        ASSERT_EQ(add_include_dir(std::string(254, char('a' + i)).c_str()), TPLEX_OK);
    EXPECT_EQ(add_include_dir("x"), TPLEX_TOO_MANY_INCLUDE_DIRS);
    include_dir_count = 0;
    EXPECT_EQ(add_include_dir(std::string(255, 'x').c_str()), TPLEX_BAD_DIRECTORY_NAME);
    EXPECT_EQ(add_include_dir(nullptr), TPLEX_BAD_DIRECTORY_NAME);
    EXPECT_EQ(include_dir_count + open_source_file(nullptr), TPLEX_NULL_FILENAME);
}

}  // namespace
}  // namespace tplex
