// Helpers shared by the test programs.
#ifndef TPLEX_TESTS_SUPPORT_H
#define TPLEX_TESTS_SUPPORT_H

#include <string>

namespace tplex::test {

// The line break that the host's text mode writes ("w" and "w+"): CR LF on
// Windows, LF on a POSIX host. Reading in text mode gives LF on both.
#ifdef _WIN32
inline constexpr const char host_line_end[] = "\r\n";
#else
inline constexpr const char host_line_end[] = "\n";
#endif

// A fresh folder under the system's temporary directory, removed with
// everything in it when the object goes.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir &) = delete;
    TempDir &operator=(const TempDir &) = delete;

    const std::string &path() const { return path_; }
    // Writes a file (bytes exactly as given) below the folder and returns
    // its full path. Folders on the way are created.
    std::string write(const std::string &name, const std::string &bytes) const;
    // Creates a sub-folder and returns its full path.
    std::string mkdir(const std::string &name) const;

private:
    std::string path_;
};

// Captures everything written to standard output (stdout's stream and file
// descriptor 1) between construction and text().
class CaptureStdout {
public:
    CaptureStdout();
    ~CaptureStdout();
    CaptureStdout(const CaptureStdout &) = delete;
    CaptureStdout &operator=(const CaptureStdout &) = delete;
    // Stops capturing (if still on) and returns what was written.
    std::string text();

private:
    int saved_fd_ = -1;
    std::string file_;
    bool done_ = false;
    std::string captured_;
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
