#include "test_support.h"

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

std::string TempDir::write(const std::string &name, const std::string &bytes) const {
    const fs::path full = fs::path(path) / name;
    fs::create_directories(full.parent_path());
    std::ofstream(full, std::ios::binary).write(bytes.data(), std::streamsize(bytes.size()));
    return full.string();
}

// Into a binary temporary file: the text as written, without text mode's CRs.
Capture::Capture(int fd)
    : fd_(fd), saved_(dup(fd)), file_(std::fopen((dir_.path + "/out").c_str(), "w+b")) {
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
    switch (t->kind) {  // clang-format off
        case tk_number: return "n:" + v + ":" + text;
        case tk_operator: return "op:" + v;
        case tk_end_of_input: return "eof";
        case tk_reserved_word: return "rw:" + v;
        case tk_hash_definition: return "def:" + text + ":" + v;
        case tk_string: return "s:" + text;
        case tk_new_identifier: return "id:" + text;
        case tk_pdf_string: return "pdf:" + text;
        case tk_char: return "ch:" + text;
        default: return "k" + std::to_string(t->kind) + ":" + v + ":" + text;
    }  // clang-format on
}

std::string rest() {
    std::string out;
    for (status_code r = 0, calls = 0; r != tk_end_of_input && calls < 20000; ++calls)
        out += (out.empty() ? "" : " ") + describe(r = sc_next_token());
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
