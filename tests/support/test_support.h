// Helpers shared by the test programs: temporary folders, captured output,
// and a lexing session with tokens in a short form, joined by blanks:
//   n:VALUE:TEXT number   s:TEXT string    op:VALUE operator  rw:VALUE reserved word
//   id:TEXT identifier    pdf:TEXT PDF     ch:TEXT character  def:TEXT:VALUE kind 25
//   eof  end of input     kKIND:VALUE:TEXT any other kind     err:xxxxxxxx a failure
#ifndef TPLEX_TESTS_SUPPORT_H
#define TPLEX_TESTS_SUPPORT_H

#include <cstdio>
#include <filesystem>
#include <string>
#include <vector>

#include "tplex/lexer.h"

namespace tplex::test {

// The line break that the host's text mode writes: CR LF on Windows.
#ifdef _WIN32
inline constexpr const char host_line_end[] = "\r\n";
#else
inline constexpr const char host_line_end[] = "\n";
#endif
inline std::error_code ignored;  // failures in destructors, which must not throw

// A fresh temporary folder, removed with its contents when the object goes.
struct TempDir {
    TempDir();
    ~TempDir() { std::filesystem::remove_all(path, ignored); }
    // Writes a file (bytes as given, folders on the way created); its full path.
    std::string write(const std::string &name, const std::string &bytes) const;
    std::string path;
};

// Captures what is written to file descriptor 1 or 2 (and its stream) until text().
class Capture {
public:
    explicit Capture(int fd = 1);
    ~Capture() { text(); }
    std::string text();

private:
    TempDir dir_;  // not tmpfile(): under Wine it fails now and then beside another program
    int fd_, saved_;
    std::FILE *file_;
    std::string captured_;
};

// Changes the working directory for the object's lifetime.
struct ChangeDir {
    explicit ChangeDir(const std::string &dir) { std::filesystem::current_path(dir); }
    ~ChangeDir() { std::filesystem::current_path(saved, ignored); }
    const std::filesystem::path saved = std::filesystem::current_path();
};

std::string err(status_code code);         // "err:d3470218"
std::string describe(status_code result);  // a call's result and the token record
inline std::string next() {                // one sc_next_token, described
    return describe(sc_next_token());
}
std::string rest();  // sc_next_token up to the end of input (at most 20000 calls)

// sc_lex_init on construction; sg_closesources and lex_free on destruction.
struct LexSession {
    LexSession() { sc_lex_init(); }
    ~LexSession() { sg_closesources(), lex_free(); }
    status_code open(const std::string &bytes) const {  // main.src, by sc_lex_init_file
        return sc_lex_init_file(dir.write("main.src", bytes).c_str());
    }
    TempDir dir;
};

// A text lexed from a fresh file in a fresh session, names predefined first.
std::string lex(const std::string &text, std::vector<std::string> defines = {});

}  // namespace tplex::test

#endif
