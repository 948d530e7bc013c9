// Helpers shared by the test programs.
#ifndef TPLEX_TESTS_SUPPORT_H
#define TPLEX_TESTS_SUPPORT_H

#include <string>

namespace tplex::test {

// The line break that the host's text mode writes: CR LF on Windows.
#ifdef _WIN32
inline constexpr const char host_line_end[] = "\r\n";
#else
inline constexpr const char host_line_end[] = "\n";
#endif

// A fresh temporary folder, removed with its contents when the object goes.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir &) = delete;
    TempDir &operator=(const TempDir &) = delete;
    const std::string &path() const { return path_; }
    // Writes a file (bytes as given, folders on the way created); its full path.
    std::string write(const std::string &name, const std::string &bytes) const;

private:
    std::string path_;
};

// Captures what is written to a file descriptor (1 or 2, with its stream)
// until text().
class Capture {
public:
    explicit Capture(int fd = 1);
    ~Capture();
    Capture(const Capture &) = delete;
    Capture &operator=(const Capture &) = delete;
    std::string text();

private:
    int fd_, saved_ = -1;
    std::string file_, captured_;
    bool done_ = false;
};

// Changes the working directory for the object's lifetime.
class ChangeDir {
public:
    explicit ChangeDir(const std::string &dir);
    ~ChangeDir();
    ChangeDir(const ChangeDir &) = delete;
    ChangeDir &operator=(const ChangeDir &) = delete;

private:
    std::string saved_;
};

}  // namespace tplex::test

#endif
