// The message operations, compared with standard output byte for byte.
#include "errors/messages.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "base/token.h"
#include "scan/char_source.h"
#include "scan/scanner.h"
#include "services/declarations.h"
#include "session/lifecycle.h"
#include "source/source_stack.h"
#include "test_support.h"
#include "tplex/services.h"

namespace tplex {
namespace {

const std::string heading = "\nTemplate compiler error :\n";
const std::string confused = "Unspecified error. The Parser is now very confused.";

// A source stack owned by the test with one file at depth 1: line 12 of main.src.
class Messages : public ::testing::Test {
protected:
    Messages() {
        std::memset(frames_.get(), 0, sizeof(source_frame) * source_frame_count);
        frames_[0].line_no = 0xFFFFFFFFu;
        frames_[1].line_no = 11;
        std::strcpy(frames_[1].path, "main.src");
        std::strcpy(frames_[1].line_text, "x = ?;\n");
        source_stack = frames_.get();
        source_depth = 1;
    }
    ~Messages() override {
        source_stack = nullptr;
        source_depth = 0;
    }
    // What display_error prints, after checking that sg_FormatError
    // writes the same.
    static std::string display(status_code code) {
        test::CaptureStdout out;
        display_error(code);
        char formatted[TPLEX_DIAGNOSTIC_SIZE];
        const std::size_t n = sg_FormatError(code, formatted, sizeof formatted);
        std::string text = out.text();
        EXPECT_EQ(std::string(formatted, n), text);
        return text;
    }
    // get_error's result, after checking the prefix it printed.
    static std::string get(status_code code) {
        test::CaptureStdout out;
        std::string text = get_error(code);
        EXPECT_EQ(out.text(), "\n\nError:   ");
        return text;
    }
    static std::string at_main(const std::string &message) {
        return heading + message + "\nFile: main.src    Line: 12\nx = ?;\n";
    }
    std::unique_ptr<source_frame[]> frames_{new source_frame[source_frame_count]};
};

TEST_F(Messages, ListedAndUnlistedCodes) {
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_main("Bad Character"));
    EXPECT_EQ(display(TPLEX_FIELD_NOT_PRESENT),
              at_main("Not an allowed field not present statement"));
    EXPECT_EQ(display(TPLEX_CLOSE_FAILED), heading + "Error Closing File\n");
    EXPECT_EQ(get(TPLEX_GENERAL_FAILURE), "General Failure Code");
    for (const auto &[code, text] : std::initializer_list<std::pair<status_code, const char *>>{
             {TPLEX_STATUS(0xD3470231u), "d3470231"},
             {TPLEX_STATUS(0xD3470233u), "d3470233"},
             {TPLEX_STATUS(0xD3470200u), "d3470200"},
             {0, "0"},
             {7, "7"},
             {TPLEX_OUT_TOO_MANY_REFERENCES, "d347000b"},
             {TPLEX_ALREADY_DEFINED, "d3431001"}}) {
        EXPECT_EQ(display(code), at_main(std::string("unspecified error: ") + text));
        EXPECT_EQ(get(code), confused);
    }
    // Both operations know the same 49 codes, all in 0xD3470201..0xD3470232.
    int listed = 0;
    for (std::uint32_t c = 0xD34701F0u; c < 0xD3470250u; ++c) {
        const std::string text = get(TPLEX_STATUS(c));
        if (text == confused) continue;
        ++listed;
        EXPECT_TRUE(c >= 0xD3470201u && c <= 0xD3470232u) << std::hex << c;
        if (TPLEX_STATUS(c) != TPLEX_CLOSE_FAILED) {
            EXPECT_EQ(display(TPLEX_STATUS(c)), at_main(text));
        }
    }
    EXPECT_EQ(listed, 49);
}

TEST_F(Messages, Position) {
    const std::string at_frame0 = heading + "Bad Character\nFile:     Line: 0\n";
    frames_[1].line_no = 0xFFFFFFFFu;  // opened, no line read yet
    frames_[1].line_text[0] = '\0';
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), heading + "Bad Character\nFile: main.src    Line: 0\n");
    for (int16_t depth : {0, 20, -1}) {
        source_depth = depth;
        EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_frame0) << depth;
    }
    source_stack = nullptr;
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_frame0);
}

// A buffer too small gets the diagnostic's start and its NUL; the result
// is the whole length all the same.
TEST_F(Messages, FormatCutsToTheBuffer) {
    const std::string whole = at_main("Bad Character");
    EXPECT_EQ(sg_FormatError(TPLEX_BAD_CHARACTER, nullptr, 0), whole.size());
    for (std::size_t size : {1u, 2u, 10u, 40u}) {
        char buffer[64];
        std::memset(buffer, 'x', sizeof buffer);
        EXPECT_EQ(sg_FormatError(TPLEX_BAD_CHARACTER, buffer, size), whole.size());
        EXPECT_EQ(std::string(buffer), whole.substr(0, size - 1)) << size;
        EXPECT_EQ(buffer[size], 'x') << size;
    }
}

// The position of a file read through the lexer: CR LF arrives as LF.
TEST(MessagesOverTheLexer, ShowTheLineBeingRead) {
    test::TempDir tmp;
    test::ChangeDir cd(tmp.path());
    tmp.write("a.src", "one\r\ntwo\r\n");
    ASSERT_EQ(lex_initialise(), TPLEX_OK);
    ASSERT_EQ(open_source_file("a.src"), 1);
    for (const char *expected = "one\nt"; *expected; ++expected) EXPECT_EQ(read_char(), *expected);
    test::CaptureStdout out;
    display_error(TPLEX_BAD_CHARACTER);
    EXPECT_EQ(out.text(), heading + "Bad Character\nFile: a.src    Line: 2\ntwo\n");
    close_sources();
    lex_free();
}

}  // namespace
}  // namespace tplex
