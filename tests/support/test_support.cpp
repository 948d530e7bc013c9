#include "test_support.h"

#include <filesystem>
#include <fstream>
#include <random>
#ifdef _WIN32
#include <io.h>
#define dup _dup
#define dup2 _dup2
#define close _close
#define fileno _fileno
#else
#include <unistd.h>
#endif

namespace fs = std::filesystem;

namespace tplex::test {

TempDir::TempDir() {
    std::random_device random;
    do path = (fs::temp_directory_path() / ("tplex-test-" + std::to_string(random()))).string();
    while (!fs::create_directory(path));
}

TempDir::~TempDir() {
    std::error_code ec;
    fs::remove_all(path, ec);
}

std::string TempDir::write(const std::string &name, const std::string &bytes) const {
    const fs::path full = fs::path(path) / name;
    fs::create_directories(full.parent_path());
    std::ofstream(full, std::ios::binary).write(bytes.data(), std::streamsize(bytes.size()));
    return full.string();
}

// A binary temporary file: the captured text is what was written, without
// the CRs of text mode.
Capture::Capture(int fd) : fd_(fd), saved_(dup(fd)), file_(std::tmpfile()) {
    std::fflush(fd == 1 ? stdout : stderr);
    dup2(fileno(file_), fd);
}

std::string Capture::text() {
    if (file_ == nullptr) return captured_;
    std::fflush(fd_ == 1 ? stdout : stderr);
    dup2(saved_, fd_), close(saved_), std::rewind(file_);
    for (int c; (c = std::fgetc(file_)) != EOF;) captured_ += static_cast<char>(c);
    std::fclose(file_), file_ = nullptr;
    return captured_;
}

ChangeDir::ChangeDir(const std::string &dir) : saved(fs::current_path().string()) {
    fs::current_path(dir);
}

ChangeDir::~ChangeDir() {
    std::error_code ec;
    fs::current_path(saved, ec);
}

std::string err(status_code code) {
    char buf[32];
    std::snprintf(buf, sizeof buf, "err:%08x", static_cast<unsigned>(code));
    return buf;
}

std::string describe(status_code result) {
    if (result < 0) return err(result);
    token_record *t = nullptr;
    sc_lex_setup(&t, nullptr, nullptr, nullptr, nullptr);
    const std::string v = std::to_string(t->value), text = t->text;
    switch (t->kind) {
        case tk_number:
            return "n:" + v + ":" + text;
        case tk_operator:
            return "op:" + v;
        case tk_end_of_input:
            return "eof";
        case tk_reserved_word:
            return "rw:" + v;
        case tk_hash_definition:
            return "def:" + text + ":" + v;
    }
    const char *prefix = t->kind == tk_string           ? "s:"
                         : t->kind == tk_new_identifier ? "id:"
                         : t->kind == tk_pdf_string     ? "pdf:"
                         : t->kind == tk_char           ? "ch:"
                                                        : nullptr;
    return prefix ? prefix + text : "k" + std::to_string(t->kind) + ":" + v + ":" + text;
}

std::string next() {
    return describe(sc_next_token());
}

std::string rest() {
    std::string out;
    for (int i = 0; i < 20000; ++i) {
        const status_code r = sc_next_token();
        out += (out.empty() ? "" : " ") + describe(r);
        if (r == tk_end_of_input) break;
    }
    return out;
}

std::string lex(const std::string &text, std::vector<std::string> defines) {
    LexSession s;
    std::vector<char *> names;
    for (std::string &n : defines) names.push_back(n.data());
    const status_code r = sc_lex_init_defines(names.data(), static_cast<int32_t>(names.size()));
    if (r != 0) return "defines: " + err(r);
    return s.open(text) == 1 ? rest() : "open failed";
}

}  // namespace tplex::test
