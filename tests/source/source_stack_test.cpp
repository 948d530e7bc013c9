// The source stack over real files in a temporary folder.
#include "source/source_stack.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstring>
#include <memory>
#include <string>

#include "base/token.h"
#include "scan/char_source.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "session/lifecycle.h"
#include "test_support.h"

namespace tplex {
namespace {

using test::ChangeDir;
using test::TempDir;

// A stack of 20 frames owned by the test, set up as lex_initialise sets it,
// in a temporary folder that is the current directory.
class SourceStack : public ::testing::Test {
protected:
    SourceStack() : cd_(tmp_.path()) {
        std::memset(frames_.get(), 0, sizeof(source_frame) * source_frame_count);
        frames_[0].line_no = 0xFFFFFFFFu;
        source_stack = frames_.get();
        source_depth = 0;
        include_dir_count = 0;
    }
    ~SourceStack() override {
        close_sources();
        source_stack = nullptr;
        source_depth = 0;
        include_dir_count = 0;
    }
    void dirs(std::initializer_list<const char *> list) {
        for (const char *d : list) ASSERT_EQ(add_include_dir(d), TPLEX_OK) << d;
    }
    // The open fails with code and leaves the depth and every frame as they
    // were, except that a file that could not be opened leaves the frame it
    // would have used at position 0, with no line and no file.
    void expect_refused(const std::string &name, status_code code) {
        const int16_t depth = source_depth;
        source_frame *failed = depth < max_source_depth ? &frames_[depth + 1] : nullptr;
        if (failed != nullptr) failed->read_pos = 7, failed->line_no = 3;  // an earlier file's
        std::string before(reinterpret_cast<char *>(frames_.get()),
                           sizeof(source_frame) * source_frame_count);
        EXPECT_EQ(open_source_file(name.c_str()), code) << name;
        EXPECT_EQ(source_depth, depth);
        if (failed != nullptr && code != TPLEX_TOO_MANY_INCLUDE_LEVELS) {
            EXPECT_EQ(failed->read_pos, 0) << name;
            EXPECT_EQ(failed->line_no, 0xFFFFFFFFu) << name;
            EXPECT_EQ(failed->file, nullptr) << name;
            failed->read_pos = 7, failed->line_no = 3;
        }
        EXPECT_EQ(std::memcmp(before.data(), frames_.get(), before.size()), 0)
            << "frames changed: " << name;
    }
    // The open succeeds as the next depth, with the frame's path as given.
    void expect_opened(const std::string &name, const std::string &path) {
        const int16_t depth = static_cast<int16_t>(source_depth + 1);
        EXPECT_EQ(open_source_file(name.c_str()), depth) << name;
        const source_frame &f = frames_[depth];
        EXPECT_STREQ(f.path, path.c_str());
        EXPECT_EQ(f.read_pos, 0);
        EXPECT_EQ(f.line_no, 0xFFFFFFFFu);
        EXPECT_STREQ(f.line_text, "");
        EXPECT_NE(f.file, nullptr);
    }
    std::string first_line(int depth) {
        char line[100];
        return std::fgets(line, sizeof line, frames_[depth].file) ? line : "";
    }

    TempDir tmp_;
    ChangeDir cd_;
    std::unique_ptr<source_frame[]> frames_{new source_frame[source_frame_count]};
};

TEST(AbsolutePath, DrivePathsAndLeadingSeparators) {
    EXPECT_FALSE(is_absolute_path("D:\\a"));  // a drive path needs 5 characters
    EXPECT_TRUE(is_absolute_path("D:\\ab"));
    EXPECT_TRUE(is_absolute_path("z:\\ab"));
    EXPECT_TRUE(is_absolute_path("\\x"));
#ifdef _WIN32
    EXPECT_FALSE(is_absolute_path("/x"));  // the POSIX form is absolute on a POSIX host only
#else
    EXPECT_TRUE(is_absolute_path("/x"));  // POSIX form
#endif
    EXPECT_FALSE(is_absolute_path("d:/x/y"));
    EXPECT_FALSE(is_absolute_path("1:\\abc"));
    EXPECT_FALSE(is_absolute_path("D:abcd"));
    EXPECT_FALSE(is_absolute_path("a\\b\\c"));
    EXPECT_FALSE(is_absolute_path(""));
}

TEST_F(SourceStack, OpensWithoutIncludeDirectories) {
    tmp_.write("main.src", "m\n");
    tmp_.write("sub/inc.src", "i\n");
    std::strcpy(frames_[2].line_text, "left by an earlier file\n");
    expect_opened("main.src", "main.src");
    // Kept as given, opened with "/"; the line text starts empty.
    expect_opened("sub\\inc.src", "sub\\inc.src");
    EXPECT_EQ(first_line(2), "i\n");
    expect_opened(tmp_.path() + "/main.src", tmp_.path() + "/main.src");
    expect_refused("none.src", TPLEX_NO_INCLUDE_DIRS);
    expect_refused(tmp_.path() + "/none.src", TPLEX_CANNOT_OPEN_SOURCE);
    expect_refused("sub", TPLEX_NO_INCLUDE_DIRS);  // a directory is not a source file
}

TEST_F(SourceStack, SearchesIncludeDirectoriesInOrder) {
    tmp_.write("inc/both.src", "inc\n");
    tmp_.write("lib/both.src", "lib\n");
    tmp_.write("lib/only.src", "lib\n");
    tmp_.write("cwd.src", "cwd\n");
    tmp_.mkdir("inc/dir.src");
    tmp_.write("lib/dir.src", "lib\n");
    dirs({"inc", "lib"});
    expect_opened("only.src", "lib\\only.src");
    expect_opened("both.src", "inc\\both.src");
    EXPECT_EQ(first_line(2), "inc\n");
    expect_opened("dir.src", "lib\\dir.src");
    expect_refused("cwd.src", TPLEX_CANNOT_OPEN_SOURCE);  // the current directory is not searched
    expect_opened(tmp_.path() + "/cwd.src", tmp_.path() + "/cwd.src");
}

TEST_F(SourceStack, JoinsWithOneBackslashAlways) {
    tmp_.write("lib/a.src", "a\n");
    tmp_.write("b.src", "b\n");
    dirs({"lib\\", "."});
    expect_opened("a.src", "lib\\\\a.src");
    expect_opened("b.src", ".\\b.src");
}

TEST_F(SourceStack, NineteenFilesAtMost) {
    tmp_.write("a.src", "a\n");
    for (int depth = 1; depth <= 19; ++depth) ASSERT_EQ(open_source_file("a.src"), depth);
    expect_refused("a.src", TPLEX_TOO_MANY_INCLUDE_LEVELS);
    EXPECT_EQ(close_sources(), TPLEX_OK);
    EXPECT_EQ(source_depth, 19);  // closing leaves the depth alone
    for (int i = 0; i < source_frame_count; ++i) EXPECT_EQ(frames_[i].file, nullptr);
    EXPECT_EQ(close_sources(), TPLEX_OK);
}

TEST_F(SourceStack, CloseFailureIsReportedAfterClosingTheRest) {
    tmp_.write("a.src", "a\n");
    for (int depth = 1; depth <= 3; ++depth) ASSERT_EQ(open_source_file("a.src"), depth);
    ::close(fileno(frames_[2].file));  // the stream's close will fail
    EXPECT_EQ(close_sources(), TPLEX_CLOSE_FAILED);
    for (int i = 1; i <= 3; ++i) EXPECT_EQ(frames_[i].file, nullptr);
    EXPECT_EQ(close_sources(), TPLEX_OK);
}

TEST_F(SourceStack, NamesThatDoNotFitThePathAreRefusedNotCut) {
    const std::string base = tmp_.path() + "/";
    const std::string fits = base + std::string(199 - base.size(), 'f');
    const std::string too_long = base + std::string(200 - base.size(), 'f');
    tmp_.write(fits.substr(base.size()), "x\n");
    tmp_.write(too_long.substr(base.size()), "x\n");
    tmp_.write(std::string(199, 'r'), "x\n");
    expect_opened(fits, fits);
    expect_refused(too_long, TPLEX_CANNOT_OPEN_SOURCE);
    tmp_.write(std::string(200, 'r'), "x\n");
    expect_opened(std::string(199, 'r'), std::string(199, 'r'));
    expect_refused(std::string(200, 'r'), TPLEX_NO_INCLUDE_DIRS);
    // Joined: "d" + "\" + 197 characters fits; "dd" + "\" + 197 does not, so
    // that directory is passed over.
    const std::string name(197, 'n');
    tmp_.write("dd/" + name, "dd\n");
    tmp_.write("d/" + name, "d\n");
    dirs({"dd", "d"});
    expect_opened(name, "d\\" + name);
    expect_refused(name + "n", TPLEX_CANNOT_OPEN_SOURCE);
}

TEST_F(SourceStack, IncludeDirectoryList) {
    for (int i = 0; i < 9; ++i)
        ASSERT_EQ(add_include_dir(std::string(254, char('a' + i)).c_str()), TPLEX_OK);
    EXPECT_EQ(add_include_dir("x"), TPLEX_TOO_MANY_INCLUDE_DIRS);
    EXPECT_EQ(include_dir_count, 9);
    EXPECT_EQ(std::string(include_dirs[8]), std::string(254, 'i'));
    EXPECT_EQ(include_dirs[9][0], '\0');
    include_dir_count = 0;
    EXPECT_EQ(add_include_dir(std::string(255, 'x').c_str()), TPLEX_BAD_DIRECTORY_NAME);
    EXPECT_EQ(add_include_dir(nullptr), TPLEX_BAD_DIRECTORY_NAME);
    EXPECT_EQ(include_dir_count, 0);
}

TEST_F(SourceStack, ArgumentsAndState) {
    EXPECT_EQ(open_source_file(nullptr), TPLEX_NULL_FILENAME);
    source_stack = nullptr;
    EXPECT_EQ(open_source_file("a.src"), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(rewind_input(), TPLEX_NOT_INITIALISED);
    EXPECT_EQ(close_sources(), TPLEX_OK);
}

// rewind_input over the lexer's own state.
class Rewind : public ::testing::Test {
protected:
    Rewind() : cd_(tmp_.path()) { EXPECT_EQ(lex_initialise(), TPLEX_OK); }
    ~Rewind() override {
        close_sources();
        lex_free();
    }
    TempDir tmp_;
    ChangeDir cd_;
};

TEST_F(Rewind, ReopensTheMainFileFoundThroughAnIncludeDirectory) {
    tmp_.write("lib/main.src", "first\r\nsecond\n");
    tmp_.write("lib/inc.src", "i\n");
    ASSERT_EQ(add_include_dir("lib"), TPLEX_OK);
    ASSERT_EQ(open_source_file("main.src"), 1);
    ASSERT_EQ(open_source_file("inc.src"), 2);
    EXPECT_EQ(read_char(), 'i');
    EXPECT_EQ(rewind_input(), 1);
    EXPECT_EQ(include_dir_count, 0);
    EXPECT_STREQ(source_stack[1].path, "lib\\main.src");
    EXPECT_EQ(source_stack[2].file, nullptr);
    std::string text;
    for (std::uint8_t c = read_char(); c != ch_end_of_input; c = read_char()) text += char(c);
    EXPECT_EQ(text, "first\nsecond\n");
    EXPECT_EQ(source_depth, 0);
}

TEST_F(Rewind, BeforeAnyFileTriesTheEmptyName) {
    EXPECT_EQ(rewind_input(), TPLEX_NO_INCLUDE_DIRS);
    EXPECT_EQ(source_depth, 0);
}

}  // namespace
}  // namespace tplex
