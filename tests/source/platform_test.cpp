// Text-mode reading on the host: CR LF, 0x1A, the line limit, and the
// boundaries of the 32 KiB blocks that the reader works in.
#include "source/platform.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstring>
#include <random>
#include <string>
#include <vector>

#include "test_support.h"

namespace tplex {
namespace {

using Lines = std::vector<std::string>;
constexpr std::size_t block = 32 * 1024;

// Reads every line of a stream; a line's length is found from a filler byte
// written behind it, so NUL bytes inside a line count as well.
Lines read_all(std::FILE *file, std::size_t capacity) {
    Lines lines;
    std::vector<char> buf(capacity + 1);
    for (;;) {
        std::memset(buf.data(), '\xEE', buf.size());
        if (!platform::read_line(file, buf.data(), capacity)) break;
        std::size_t len = std::string(buf.data(), buf.size()).find('\xEE') - 1;
        EXPECT_EQ(buf[len], '\0');
        EXPECT_LT(len, capacity);
        lines.emplace_back(buf.data(), len);
    }
    EXPECT_FALSE(platform::read_line(file, buf.data(), capacity));  // the end stays the end
    return lines;
}

Lines lines_of(const std::string &bytes, std::size_t capacity = 5000) {
    test::TempDir tmp;
    std::FILE *file = platform::open_source(tmp.write("f.src", bytes).c_str());
    EXPECT_NE(file, nullptr);
    Lines lines = read_all(file, capacity);
    EXPECT_EQ(platform::close_source(file), 0);
    return lines;
}

// What text mode makes of the bytes, a character at a time, cut into lines.
Lines reference_lines(const std::string &bytes, std::size_t capacity) {
    std::string text;
    for (std::size_t i = 0; i < bytes.size() && bytes[i] != '\x1A'; ++i) {
        if (bytes[i] == '\r' && i + 1 < bytes.size() && bytes[i + 1] == '\n') continue;
        text += bytes[i];
    }
    Lines lines;
    std::string line;
    for (char c : text) {
        line += c;
        if (c == '\n' || line.size() == capacity - 1)
            lines.push_back(std::move(line)), line.clear();
    }
    if (!line.empty()) lines.push_back(line);
    return lines;
}

void expect_as_text_mode(const std::string &bytes, std::size_t capacity) {
    EXPECT_EQ(lines_of(bytes, capacity), reference_lines(bytes, capacity))
        << "capacity " << capacity;
}

std::string s(const char *bytes, std::size_t n) {
    return std::string(bytes, n);
}

TEST(TextMode, LineEnds) {
    EXPECT_EQ(lines_of("a\nb\n"), (Lines{"a\n", "b\n"}));
    EXPECT_EQ(lines_of("a\r\nb\r\n"), (Lines{"a\n", "b\n"}));
    EXPECT_EQ(lines_of("a\rb\n"), (Lines{"a\rb\n"}));
    EXPECT_EQ(lines_of("a\r\r\n\r"), (Lines{"a\r\n", "\r"}));
    EXPECT_EQ(lines_of("\n\n"), (Lines{"\n", "\n"}));
    EXPECT_EQ(lines_of("last"), (Lines{"last"}));
    EXPECT_EQ(lines_of(""), (Lines{}));
    EXPECT_EQ(lines_of(s("a\0b\n\0", 5)), (Lines{s("a\0b\n", 4), s("\0", 1)}));
}

TEST(TextMode, EndMarkEndsTheFile) {
    EXPECT_EQ(lines_of("a\x1A"
                       "b\n"),
              (Lines{"a"}));
    EXPECT_EQ(lines_of("\x1A"
                       "b\n"),
              (Lines{}));
    EXPECT_EQ(lines_of("a\n\x1A\nb\x1A"), (Lines{"a\n"}));
    EXPECT_EQ(lines_of("a\r\x1A\n"), (Lines{"a\r"}));
}

TEST(TextMode, LimitCountsTranslatedCharacters) {
    EXPECT_EQ(lines_of("abcdef\n", 4), (Lines{"abc", "def", "\n"}));
    EXPECT_EQ(lines_of("ab\r\ncd", 4), (Lines{"ab\n", "cd"}));
    EXPECT_EQ(lines_of("abc\r\nd", 4), (Lines{"abc", "\n", "d"}));
    EXPECT_EQ(lines_of("ab", 2), (Lines{"a", "b"}));
    EXPECT_EQ(lines_of("ab", 1), (Lines{}));
}

TEST(TextMode, BlockBoundaries) {
    const std::string x(block - 1, 'x');
    for (std::size_t cap : {std::size_t{5000}, 3 * block}) {
        expect_as_text_mode(x + "\r\ny\r\n", cap);  // CR LF split between two blocks
        expect_as_text_mode(x + "\rz\n", cap);      // CR last in a block, then a letter
        expect_as_text_mode(x + "\r", cap);         // CR last in the file
        expect_as_text_mode(x + "\r\x1A\n", cap);   // CR, then the end mark in the next block
        expect_as_text_mode(x + "\x1A"
                                "after",
                            cap);
        expect_as_text_mode(x + "y\x1A"
                                "after",
                            cap);  // mark first in the second block
        expect_as_text_mode(x + "\r\n" + std::string(block - 2, 'w') + "\r\nend", cap);
        expect_as_text_mode(std::string(3 * block + 17, 'l') + "\n" + "tail", cap);
    }
}

TEST(TextMode, RandomFilesAgreeWithCharacterAtATime) {
    std::mt19937 rng(20240611);
    const char alphabet[] = "ab\r\n\r\n\r";
    for (int round = 0; round < 12; ++round) {
        std::string bytes(2 * block + rng() % block, 'a');
        for (char &c : bytes) c = alphabet[rng() % 7];
        if (round % 2 == 0) bytes[block - 8 + rng() % (block / 2)] = '\x1A';
        for (std::size_t cap : {std::size_t{2}, std::size_t{7}, std::size_t{5000}})
            expect_as_text_mode(bytes, cap);
    }
}

TEST(TextMode, StreamsNotOpenedHereReadTheSame) {
#ifndef _WIN32
    // On Windows text mode belongs to the C runtime and is chosen when a file
    // is opened: a stream opened in binary mode reads its bytes unchanged.
    test::TempDir tmp;
    std::FILE *file = std::fopen(tmp.write("f",
                                           "a\r\nb\rc\x1A"
                                           "d\n")
                                     .c_str(),
                                 "rb");
    EXPECT_EQ(read_all(file, 5000), (Lines{"a\n", "b\rc"}));
    std::fclose(file);
#endif
    char line[8] = "x";
    EXPECT_FALSE(platform::read_line(nullptr, line, sizeof line));
    EXPECT_STREQ(line, "x") << "a read that gets nothing leaves the line as it was";
}

TEST(PlatformOpen, PathsAndSlots) {
    test::TempDir tmp;
    tmp.write("d/f.src", "f\n");
    std::FILE *file = platform::open_source((tmp.path() + "\\d\\f.src").c_str());
    ASSERT_NE(file, nullptr);
    EXPECT_EQ(read_all(file, 100), (Lines{"f\n"}));
    EXPECT_EQ(platform::close_source(file), 0);
    EXPECT_EQ(platform::open_source(tmp.path().c_str()), nullptr);  // a directory
    EXPECT_EQ(platform::open_source((tmp.path() + "/" + std::string(2500, 'p')).c_str()), nullptr);

#ifndef _WIN32
    // Every slot taken: the next open fails, and works again once one is free.
    // (The POSIX layer's own read slots; on Windows the C runtime's limit on
    // open streams applies instead.)
    std::vector<std::FILE *> open;
    const std::string path = tmp.path() + "/d/f.src";
    while (std::FILE *f = platform::open_source(path.c_str())) open.push_back(f);
    EXPECT_EQ(open.size(), 24u);
    EXPECT_EQ(platform::close_source(open.back()), 0);
    open.back() = platform::open_source(path.c_str());
    EXPECT_NE(open.back(), nullptr);
    for (std::FILE *f : open) EXPECT_EQ(platform::close_source(f), 0);
#endif

    // A stream closed behind the layer's back: a new stream at its address
    // reads its own bytes.
    const std::string other = tmp.write("o.src", "other\n");
    std::FILE *closed = platform::open_source(tmp.write("c.src", "first\nsecond\n").c_str());
    char line[3];
    EXPECT_TRUE(platform::read_line(closed, line, sizeof line));
    std::fclose(closed);
    file = platform::open_source(other.c_str());
    EXPECT_EQ(read_all(file, 100), (Lines{"other\n"}));
    EXPECT_EQ(platform::close_source(file), 0);
}

}  // namespace
}  // namespace tplex
