// File name rules: splitting, the default name and validation.
#include "services/file_names.h"

#include <gtest/gtest.h>

#include <cstring>
#include <string>

namespace tplex {
namespace {

// Splits a path with the expected extension; checks the three parts and what
// is left of the caller's text.
void expect_split(std::string path, const char *ext, const char *dir, const char *name,
                  const char *ext_part, const char *path_after) {
    file_spec out;
    std::memset(&out, 'Z', sizeof out);
    const std::string given = path;
    split_file_spec(path.data(), ext, &out);
    EXPECT_STREQ(out.dir_part, dir) << given;
    EXPECT_STREQ(out.name_part, name) << given;
    EXPECT_STREQ(out.ext_part, ext_part) << given;
    EXPECT_STREQ(path.c_str(), path_after);
}

std::uint8_t invalid(const std::string &dir, const std::string &name, const std::string &ext) {
    file_spec parts{};
    dir.copy(parts.dir_part, sizeof parts.dir_part - 1);
    name.copy(parts.name_part, sizeof parts.name_part - 1);
    ext.copy(parts.ext_part, sizeof parts.ext_part - 1);
    return file_spec_invalid(&parts);
}

TEST(FileSpec, Split) {
    expect_split("a\\b\\c.x", "x", "a\\b", "c", "x", "c.x");
    expect_split("a\\b\\c.x", "y", "a\\b", "c.x", "", "c.x");
    expect_split("F.X", "x", "", "F.X", "", "F.X");  // case-sensitive
    expect_split("c", "", "", "c", "", "c");
    expect_split("c", "x", "", "c", "", "c");  // an extension is never added
    expect_split(".x", "x", "", ".x", "", ".x");
    expect_split("a.b.c", "c", "", "a.b", "c", "a.b.c");
    expect_split("c.", "", "", "c", "", "c.");  // the text after the stop is empty
    expect_split("\\c.x", "x", "", "\\c", "x", "\\c.x");
    expect_split("a/b\\c", "", "a/b", "c", "", "c");
    expect_split("d\\", "x", "d", "", "", "");
    expect_split("$", "x", "", "$", "x", "$");
    expect_split("d\\$", "x", "d", "$", "", "$");
    expect_split("$.x", "x", "", "$", "x", "$.x");
}

TEST(FileSpec, LongPartsAreCutToTheirFields) {
    expect_split(std::string(300, 'd') + "\\n.x", "x", std::string(199, 'd').c_str(), "n", "x",
                 "n.x");
    expect_split(std::string(100, 'n') + ".x", "x", "", std::string(79, 'n').c_str(), "x",
                 (std::string(100, 'n') + ".x").c_str());
    expect_split("$", "0123456789abcdefghij", "", "$", "0123456789abcde", "$");
    file_spec parts{};
    split_file_spec(std::string(300, 'd').append("\\n").data(), "", &parts);
    EXPECT_EQ(file_spec_invalid(&parts), 1);
}

TEST(FileSpec, DefaultName) {
    file_spec parts{};
    split_file_spec(std::string("$").data(), "x", &parts);
    apply_default_name(&parts, "main");
    EXPECT_STREQ(parts.name_part, "main");
    EXPECT_STREQ(parts.ext_part, "x");
    apply_default_name(&parts, "other");  // only the marker is replaced
    EXPECT_STREQ(parts.name_part, "main");
    split_file_spec(std::string("d\\$").data(), "x", &parts);
    apply_default_name(&parts, "main");
    EXPECT_STREQ(parts.name_part, "main");
    EXPECT_EQ(file_spec_invalid(&parts), 0);
}

TEST(FileSpec, Validity) {
    EXPECT_EQ(invalid("", "", ""), 0);
    EXPECT_EQ(invalid(std::string(100, 'd'), std::string(40, 'n'), std::string(10, 'e')), 0);
    EXPECT_EQ(invalid(std::string(101, 'd'), "n", ""), 1);
    EXPECT_EQ(invalid("", std::string(41, 'n'), ""), 1);
    EXPECT_EQ(invalid("", "n", std::string(11, 'e')), 1);
    EXPECT_EQ(invalid("d", "", ""), 1);
    EXPECT_EQ(invalid("", "", "x"), 0);
    EXPECT_EQ(invalid("a#b\\c/d~-:._ ", "n", ""), 0);
    EXPECT_EQ(invalid("", "n/a~-:_. 9Z", "e/~-:_. "), 0);
    EXPECT_EQ(invalid("", "a#b", ""), 1);
    EXPECT_EQ(invalid("", "\\c", ""), 1);
    EXPECT_EQ(invalid("", "n", "e#"), 1);
    EXPECT_EQ(invalid("", "$", ""), 1);
    EXPECT_EQ(invalid("d$", "n", ""), 1);
    EXPECT_EQ(invalid("", "caf\xC3\xA9", ""), 1);
    EXPECT_EQ(invalid("", "tab\t", ""), 1);
    EXPECT_EQ(invalid("", "n", "*"), 1);
    file_spec unterminated;
    std::memset(&unterminated, 'a', sizeof unterminated);
    EXPECT_EQ(file_spec_invalid(&unterminated), 1);
}

}  // namespace
}  // namespace tplex
