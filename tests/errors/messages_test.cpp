// The message operations, compared with standard output byte for byte.
#include "errors/messages.h"

#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>

#include "lex/lexer.h"
#include "scan/char_source.h"
#include "source/source_stack.h"
#include "test_support.h"

namespace tplex {
namespace {

constexpr const char *heading = "\nTemplate compiler error :\n";
constexpr const char *confused = "Unspecified error. The Parser is now very confused.";

// A source stack owned by the test, as lex_initialise leaves it, with one
// file at depth 1: line 12 of main.src.
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
    static std::string display(status_code code) {
        test::CaptureStdout out;
        display_error(code);
        return out.text();
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
    static std::string at_frame0(const std::string &message) {
        return heading + message + "\nFile:     Line: 0\n";
    }

    std::unique_ptr<source_frame[]> frames_{new source_frame[source_frame_count]};
};

TEST_F(Messages, DisplayListedCodes) {
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_main("Bad Character"));
    EXPECT_EQ(display(TPLEX_GENERAL_FAILURE), at_main("General Failure Code"));
    EXPECT_EQ(display(TPLEX_FIELD_NOT_PRESENT),
              at_main("Not an allowed field not present statement"));
    EXPECT_EQ(display(TPLEX_BAD_HASH_WORD), at_main("Unrecognisd or Invalid Hash Word"));
    EXPECT_EQ(display(TPLEX_CLOSE_FAILED), std::string(heading) + "Error Closing File\n");
}

TEST_F(Messages, DisplayUnlistedCodes) {
    EXPECT_EQ(display(TPLEX_STATUS(0xD3470231u)), at_main("unspecified error: d3470231"));
    EXPECT_EQ(display(TPLEX_STATUS(0xD3470233u)), at_main("unspecified error: d3470233"));
    EXPECT_EQ(display(TPLEX_STATUS(0xD3470200u)), at_main("unspecified error: d3470200"));
    EXPECT_EQ(display(0), at_main("unspecified error: 0"));
    EXPECT_EQ(display(7), at_main("unspecified error: 7"));
    EXPECT_EQ(display(TPLEX_OUT_TOO_MANY_REFERENCES), at_main("unspecified error: d347000b"));
    EXPECT_EQ(display(TPLEX_ALREADY_DEFINED), at_main("unspecified error: d3431001"));
}

TEST_F(Messages, DisplayPosition) {
    frames_[1].line_no = 0xFFFFFFFFu;  // opened, no line read yet
    frames_[1].line_text[0] = '\0';
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER),
              heading + std::string("Bad Character\nFile: main.src    Line: 0\n"));
    source_depth = 0;
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_frame0("Bad Character"));
    source_depth = 20;
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_frame0("Bad Character"));
    source_depth = -1;
    EXPECT_EQ(display(TPLEX_BAD_CHARACTER), at_frame0("Bad Character"));
    source_stack = nullptr;
    EXPECT_EQ(display(TPLEX_NULL_FILENAME), at_frame0("Null Filename"));
}

TEST_F(Messages, GetError) {
    EXPECT_EQ(get(TPLEX_BAD_CHARACTER), "Bad Character");
    EXPECT_EQ(get(TPLEX_CLOSE_FAILED), "Error Closing File");
    EXPECT_EQ(get(TPLEX_FIELD_NOT_PRESENT), "Not an allowed field not present statement");
    for (status_code unlisted :
         {TPLEX_STATUS(0xD3470231u), TPLEX_STATUS(0xD3470233u), TPLEX_STATUS(0xD3470200u), 0,
          TPLEX_OUT_TOO_MANY_REFERENCES, TPLEX_MACRO_REDEFINED}) {
        EXPECT_EQ(get(unlisted), confused);
    }
    test::CaptureStdout out;
    get_error(TPLEX_OK);
    get_error(TPLEX_BAD_CHARACTER);
    EXPECT_EQ(out.text(), "\n\nError:   \n\nError:   ");
}

// Both operations know the same codes: 49 texts, all in 0xD3470201..0xD3470232.
TEST_F(Messages, BothOperationsKnowTheSameCodes) {
    int listed = 0;
    for (std::uint32_t c = 0xD34701F0u; c < 0xD3470250u; ++c) {
        const status_code code = TPLEX_STATUS(c);
        const std::string text = get(code);
        if (text == confused) {
            EXPECT_EQ(status_text(code), nullptr);
            continue;
        }
        ++listed;
        EXPECT_TRUE(c >= 0xD3470201u && c <= 0xD3470232u) << std::hex << c;
        if (code != TPLEX_CLOSE_FAILED) {
            EXPECT_EQ(display(code), at_main(text));
        }
    }
    EXPECT_EQ(listed, 49);
}

// The position of a file read through the lexer: CR LF arrives as LF.
TEST(MessagesOverTheLexer, ShowTheLineBeingRead) {
    test::TempDir tmp;
    test::ChangeDir cd(tmp.path());
    tmp.write("a.src", "one\r\ntwo\r\n");
    ASSERT_EQ(lex_initialise(), TPLEX_OK);
    ASSERT_EQ(open_source_file("a.src"), 1);
    test::CaptureStdout before;
    display_error(TPLEX_BAD_CHARACTER);
    EXPECT_EQ(before.text(), heading + std::string("Bad Character\nFile: a.src    Line: 0\n"));
    for (const char *expected = "one\nt"; *expected; ++expected) EXPECT_EQ(read_char(), *expected);
    test::CaptureStdout after;
    display_error(TPLEX_BAD_CHARACTER);
    EXPECT_EQ(after.text(), heading + std::string("Bad Character\nFile: a.src    Line: 2\ntwo\n"));
    close_sources();
    lex_free();
}

}  // namespace
}  // namespace tplex
