// tplex: the lexer's command-line tool. It drives the library through its
// exported functions in the order the compiler's parser does (sc_lex_init,
// sc_lex_setup, sc_lex_init_defines, sc_lex_init_file, sc_next_token until
// the end of input, sg_closesources, lex_free) and shows what it delivers.
//
// tplex table checks a table file with the table output module's checker.
//
// Exit status: 0 the input lexed without a failure (a sound table file),
// 1 the input had failures (a damaged table file, or check --strict with
// warnings), 2 a usage error, a file or option that the lexer refused, or
// standard output that could not be written.
#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#ifdef _WIN32
#include <io.h>
#define tool_isatty _isatty
#else
#include <unistd.h>
#define tool_isatty isatty
#endif

#include "report.h"
#include "tplex/lexer.h"
#include "tplex/services.h"
#include "tplex/table_output.h"

namespace tplex::tool {
namespace {

constexpr int exit_clean = 0;
constexpr int exit_failures = 1;
constexpr int exit_usage = 2;

// The same failure at the same place this many times in a row, with no
// token in between, means the lexer makes no progress: the tool stops. A
// source line holds at most 4999 characters, so a line of bad characters
// stays below it.
constexpr unsigned long stuck_limit = 10000;

// Failures reported by default before the rest are only counted: enough to
// see every kind a source has, few enough that a binary file read as source
// does not bury the terminal (a megabyte of "$" is a million failures).
constexpr unsigned long default_max_failures = 100;

const char *const program = "tplex";

// ---------------------------------------------------------------------------
// Command line
// ---------------------------------------------------------------------------

struct Options {
    std::vector<std::string> include_dirs;  // -I, in order
    std::vector<std::string> defines;       // -D, in order
    std::string file;
    bool json = false;                                  // tokens --json
    bool all = false;                                   // dict --all
    bool strict = false;                                // check --strict
    unsigned long max_failures = default_max_failures;  // 0: no limit
};

// What a command accepts besides FILE.
enum CommandOptions : unsigned {
    takes_lexing = 1,  // -I, -D and --max-failures
    takes_json = 2,    // --json
    takes_all = 4,     // --all
    takes_strict = 8,  // --strict
};

struct Command {
    const char *name;
    const char *usage;  // the usage line after "tplex "
    const char *help;   // what it does and its options
    unsigned options;   // CommandOptions
    int (*run)(const Options &);
};

const char *const lexing_options =
    "  -I DIR      search DIR for #include files (up to 9, in order); with none,\n"
    "              included names are opened relative to the current directory\n"
    "  -D NAME     predefine NAME, as #define NAME would (case does not matter)\n"
    "  --max-failures N\n"
    "              print at most N failures (default 100, 0 for no limit); the\n"
    "              rest are counted, and the exit status is 1 all the same\n";
const char *const help_option = "  -h, --help  show this help\n";

void print_general_usage(std::FILE *out) {
    std::fprintf(out,
                 "usage: tplex tokens [--json] [-I DIR]... [-D NAME]... FILE\n"
                 "       tplex dict [--all] [-I DIR]... [-D NAME]... FILE\n"
                 "       tplex check [--strict] [-I DIR]... [-D NAME]... FILE\n"
                 "       tplex table FILE\n"
                 "       tplex --version | --help\n"
                 "\n"
                 "Drives the tplex lexer over FILE as the template compiler's parser does.\n"
                 "\n"
                 "  tokens   print the token stream, one token or failure per line\n"
                 "  dict     lex FILE, then list the symbol dictionary\n"
                 "  check    lex FILE once, print each failure, warnings and the count\n"
                 "  table    check a table file (raw or hex text) and summarise it\n"
                 "\n"
                 "Run 'tplex COMMAND --help' for the options of a command.\n"
                 "Exit status: 0 no failure, 1 the input had failures, 2 usage or I/O error.\n"
                 "Paths are shown with '/' on POSIX hosts.\n");
}

int usage_error(const char *command, const std::string &what) {
    std::fprintf(stderr, "%s: %s\n", program, what.c_str());
    if (command != nullptr)
        std::fprintf(stderr, "Run '%s %s --help' for its usage.\n", program, command);
    else
        std::fprintf(stderr, "Run '%s --help' for usage.\n", program);
    return exit_usage;
}

// A --max-failures count: decimal digits only.
bool parse_count(const std::string &text, unsigned long &count) {
    if (text.empty() || text.size() > 9 ||
        text.find_first_not_of("0123456789") != std::string::npos)
        return false;
    count = std::strtoul(text.c_str(), nullptr, 10);
    return true;
}

const std::string max_failures_option = "--max-failures";

// Parses the arguments after the command name. Returns -1 to go on, else
// the exit status (help shown, or a usage error).
int parse_options(const Command &cmd, int argc, char **argv, Options &opt) {
    bool files_only = false;
    for (int i = 0; i < argc; ++i) {
        const std::string arg = argv[i];
        if (!files_only && arg.size() > 1 && arg[0] == '-') {
            if (arg == "--") {
                files_only = true;
            } else if (arg == "-h" || arg == "--help") {
                std::printf("usage: tplex %s\n\n%s\n%s%s", cmd.usage, cmd.help,
                            (cmd.options & takes_lexing) != 0 ? lexing_options : "", help_option);
                return exit_clean;
            } else if ((cmd.options & takes_lexing) != 0 &&
                       (arg.compare(0, 2, "-I") == 0 || arg.compare(0, 2, "-D") == 0)) {
                std::string value = arg.substr(2);
                if (value.empty()) {
                    if (i + 1 >= argc) return usage_error(cmd.name, arg + " needs a value");
                    value = argv[++i];
                }
                if (value.empty()) return usage_error(cmd.name, arg + " needs a value");
                (arg[1] == 'I' ? opt.include_dirs : opt.defines).push_back(value);
            } else if ((cmd.options & takes_lexing) != 0 &&
                       arg.compare(0, max_failures_option.size(), max_failures_option) == 0 &&
                       (arg.size() == max_failures_option.size() ||
                        arg[max_failures_option.size()] == '=')) {
                std::string value;
                if (arg.size() > max_failures_option.size())
                    value = arg.substr(max_failures_option.size() + 1);  // after "="
                else if (i + 1 < argc)
                    value = argv[++i];
                if (!parse_count(value, opt.max_failures))
                    return usage_error(cmd.name, "--max-failures needs a count (0 to 999999999)");
            } else if (arg == "--strict" && (cmd.options & takes_strict) != 0) {
                opt.strict = true;
            } else if (arg == "--json" && (cmd.options & takes_json) != 0) {
                opt.json = true;
            } else if (arg == "--all" && (cmd.options & takes_all) != 0) {
                opt.all = true;
            } else {
                return usage_error(cmd.name, "unknown option '" + arg + "'");
            }
        } else if (opt.file.empty()) {
            opt.file = arg;
        } else {
            return usage_error(cmd.name, "only one FILE, got '" + opt.file + "' and '" + arg + "'");
        }
    }
    if (opt.file.empty()) return usage_error(cmd.name, "no FILE given");
    return -1;
}

// ---------------------------------------------------------------------------
// One lexing session: the parser's calling order
// ---------------------------------------------------------------------------

// Why a file could not be opened, in terms the user can act on: the
// library's status code says only that it failed. Empty when the file can
// be opened now (the library's code is then the whole story).
std::string open_failure_reason(const std::string &name) {
    if (name.size() > TPLEX_PATH_SIZE - 1) {
        return "the name is longer than the " + std::to_string(TPLEX_PATH_SIZE - 1) +
               " characters a path may have";
    }
    // Opened as the library opens it: "\" is a separator on every host.
    const std::string host = display_path(name);
    struct stat st {};
    if (stat(host.c_str(), &st) != 0) {
        if (errno != ENOENT) return std::strerror(errno);
        return name == "-" ? "not found; standard input is not read, name a file" : "not found";
    }
    if (S_ISDIR(st.st_mode)) return "is a directory";
    std::FILE *file = std::fopen(host.c_str(), "r");
    if (file == nullptr) return errno == EACCES ? "permission denied" : std::strerror(errno);
    std::fclose(file);
    return "";
}

class Session {
public:
    Session() = default;
    Session(const Session &) = delete;
    Session &operator=(const Session &) = delete;
    ~Session() {
        if (initialised_) {
            sg_closesources();
            lex_free();
        }
    }

    // sc_lex_init, sc_lex_setup, the -D names, the main file, then the -I
    // directories. The directories come after the main file because a
    // relative name is searched only in them once there are any, and the
    // main file is named relative to the current directory. -1 when ready,
    // else the exit status (the reason printed on standard error).
    int open(const Options &opt) {
        const status_code init = sc_lex_init();
        if (init < 0) return io_error("cannot initialise the lexer", "", init);
        initialised_ = true;
        sc_lex_setup(&token_, &frames_, &depth_, nullptr, nullptr);

        for (const std::string &name : opt.defines) {
            std::vector<char> writable(name.begin(), name.end());
            writable.push_back('\0');
            char *names[] = {writable.data()};
            if (sc_lex_init_defines(names, 1) < 0)
                return usage_error(nullptr, "-D " + name +
                                                ": the name is already known (a reserved word, a "
                                                "hash word or an earlier -D)");
        }
        const status_code opened = sc_lex_init_file(opt.file.c_str());
        if (opened < 0)
            return io_error("cannot open " + opt.file, open_failure_reason(opt.file), opened);
        main_file_ = opt.file;
        for (const std::string &dir : opt.include_dirs) {
            const status_code added = ::add_include_dir(dir.c_str());
            if (added < 0) return io_error("-I " + dir, "", added);
        }
        return -1;
    }

    const token_record &token() const { return *token_; }

    // Where the token just delivered ends: the file being read and its line.
    // At the end of input no file is open any more: the main file, the last
    // one closed, at its last line.
    std::string file() const { return *depth_ >= 1 ? frames_[*depth_].path : main_file_; }
    unsigned long line() const { return static_cast<std::uint32_t>(frame().line_no + 1u); }

    // The diagnostic of a failure. Where the library shows no file (at the
    // end of input), the position and line are those of file() and line().
    Diagnostic diagnose(status_code code) const {
        Diagnostic d = diagnostic_of(code);
        if (!d.has_position || d.file.empty()) {
            d.has_position = true;
            d.file = file();
            d.line = static_cast<long>(line());
            d.source = frame().line_text;
            while (!d.source.empty() && d.source.back() == '\n') d.source.pop_back();
        }
        return d;
    }

private:
    const source_frame &frame() const { return frames_[*depth_ >= 1 ? *depth_ : 1]; }

    // "tplex: WHAT: REASON (CODE: MESSAGE)", or without REASON.
    static int io_error(const std::string &what, const std::string &reason, status_code code) {
        const Diagnostic d = diagnostic_of(code);
        const std::string library = hex_code(code) + ": " + d.message;
        if (reason.empty())
            std::fprintf(stderr, "%s: %s: %s\n", program, what.c_str(), d.message.c_str());
        else
            std::fprintf(stderr, "%s: %s: %s (%s)\n", program, what.c_str(), reason.c_str(),
                         library.c_str());
        return exit_usage;
    }

    bool initialised_ = false;
    token_record *token_ = nullptr;
    source_frame *frames_ = nullptr;
    int16_t *depth_ = nullptr;
    std::string main_file_;
};

// Counts a failure repeated at the same place with no token in between.
class StuckGuard {
public:
    // False once the same failure has come stuck_limit times in a row.
    bool note_failure(status_code code, const std::string &file, unsigned long line) {
        if (count_ > 0 && code == code_ && line == line_ && file == file_) {
            return ++count_ < stuck_limit;
        }
        code_ = code;
        file_ = file;
        line_ = line;
        count_ = 1;
        return true;
    }
    void note_token() { count_ = 0; }

private:
    status_code code_ = 0;
    std::string file_;
    unsigned long line_ = 0;
    unsigned long count_ = 0;
};

void report_stuck(const std::string &file, unsigned long line) {
    std::fflush(stdout);
    std::fprintf(stderr, "%s: %s:%lu: the same failure came %lu times without progress; stopped\n",
                 program, display_path(file).c_str(), line, stuck_limit);
}

// What the language lets pass without a failure but is nearly always a
// mistake: block comments that run past the end of a file (noted as they
// happen) and regions still open at the end of input.
class Warnings {
public:
    Warnings() : comments_seen_(tplex_comments_past_file_end(nullptr, nullptr)) {}

    // After each sc_next_token.
    void poll() {
        tplex_place ended;
        std::uint32_t opened_line = 0;
        const std::uint32_t seen = tplex_comments_past_file_end(&ended, &opened_line);
        if (seen == comments_seen_) return;
        comments_seen_ = seen;
        if (opened_line != 0)
            add(ended.path, opened_line,
                "/* comment opened here is still open at the end of the file (line " +
                    std::to_string(ended.line) + ")");
        else
            add(ended.path, ended.line, "/* comment still open at the end of the file");
    }

    // At the end of input.
    void finish() {
        std::vector<tplex_place> places(static_cast<std::size_t>(tplex_open_regions(nullptr, 0)));
        tplex_open_regions(places.data(), static_cast<std::int32_t>(places.size()));
        for (const tplex_place &p : places)
            add(p.path, p.line, "#ifdef/#ifndef region still open at the end of input");
    }

    const std::vector<std::string> &lines() const { return lines_; }

private:
    void add(const char *path, unsigned long line, const std::string &what) {
        lines_.push_back(display_path(path) + ":" + std::to_string(line) + ": warning: " + what);
    }

    std::uint32_t comments_seen_;
    std::vector<std::string> lines_;
};

// Failures printed up to the --max-failures limit; the rest only counted.
class FailureLog {
public:
    explicit FailureLog(unsigned long limit) : limit_(limit) {}
    // Counts a failure; true when it is to be printed.
    bool admit() { return ++count_ <= limit_ || limit_ == 0; }
    void add_unprinted() { ++count_; }
    unsigned long count() const { return count_; }
    unsigned long hidden() const { return limit_ == 0 || count_ <= limit_ ? 0 : count_ - limit_; }
    std::string hidden_note() const {
        return std::to_string(hidden()) + " more failure" + (hidden() == 1 ? "" : "s") +
               " not shown (--max-failures " + std::to_string(limit_) + ")";
    }

private:
    unsigned long limit_;
    unsigned long count_ = 0;
};

// Runs sc_next_token to the end of input, or until standard output fails.
// on_token sees every token (the end of input included), on_failure every
// failure the log admits, with its diagnostic; warnings, when given, are
// polled after every call and finished at the end of input.
template <typename OnToken, typename OnFailure>
void lex_all(Session &session, FailureLog &log, Warnings *warnings, OnToken on_token,
             OnFailure on_failure) {
    StuckGuard guard;
    while (std::ferror(stdout) == 0) {
        const status_code r = sc_next_token();
        if (warnings != nullptr) warnings->poll();
        if (r < 0) {
            if (log.admit()) on_failure(session.diagnose(r), r);
            if (!guard.note_failure(r, session.file(), session.line())) {
                report_stuck(session.file(), session.line());
                break;
            }
            continue;
        }
        guard.note_token();
        on_token(session);
        if (r == tk_end_of_input) {
            if (warnings != nullptr) warnings->finish();
            break;
        }
    }
}

// ---------------------------------------------------------------------------
// tplex tokens
// ---------------------------------------------------------------------------

std::string token_text(const token_record &t) {
    if (t.kind == tk_operator) return operator_spelling(t.value);
    if (t.kind == tk_end_of_input) return "";
    return t.text;
}

void print_token(const Session &s, bool json) {
    const token_record &t = s.token();
    const bool has_value = kind_has_value(t.kind);
    const std::string file = display_path(s.file());
    if (json) {
        std::printf("{\"file\":%s,\"line\":%lu,\"kind\":%u,\"name\":%s,\"value\":%s,\"text\":%s}\n",
                    json_string(file).c_str(), s.line(), static_cast<unsigned>(t.kind),
                    json_string(kind_name(t.kind)).c_str(),
                    has_value ? std::to_string(t.value).c_str() : "null",
                    json_string(token_text(t)).c_str());
    } else {
        std::printf("%s:%lu: %-15s %11s %s\n", file.c_str(), s.line(), kind_name(t.kind).c_str(),
                    has_value ? std::to_string(t.value).c_str() : "-",
                    quoted(token_text(t)).c_str());
    }
}

void print_failure(const Diagnostic &d, status_code code, bool json) {
    const std::string file = display_path(d.file);
    if (json) {
        std::printf("{\"file\":%s,\"line\":%ld,\"failure\":%s,\"message\":%s,\"source\":%s}\n",
                    json_string(file).c_str(), d.line, json_string(hex_code(code)).c_str(),
                    json_string(d.message).c_str(), json_string(d.source).c_str());
    } else {
        std::printf("%s:%ld: %-15s %11s %s\n", file.c_str(), d.line, "FAILURE",
                    hex_code(code).c_str(), quoted(d.message).c_str());
    }
}

int run_tokens(const Options &opt) {
    Session session;
    const int status = session.open(opt);
    if (status >= 0) return status;
    FailureLog log(opt.max_failures);
    lex_all(
        session, log, nullptr, [&](const Session &s) { print_token(s, opt.json); },
        [&](const Diagnostic &d, status_code code) { print_failure(d, code, opt.json); });
    // Standard output carries tokens only (one JSON object a line with
    // --json): the count of the rest goes to standard error.
    if (log.hidden() > 0) {
        std::fflush(stdout);
        std::fprintf(stderr, "%s: %s\n", program, log.hidden_note().c_str());
    }
    return log.count() == 0 ? exit_clean : exit_failures;
}

// ---------------------------------------------------------------------------
// tplex check and tplex dict
// ---------------------------------------------------------------------------

// A failure in the form sg_DisplayError prints it, with the tool's path.
void display_failure(const Diagnostic &d) {
    std::printf("\nTemplate compiler error :\n%s", d.message.c_str());
    if (d.has_position)
        std::printf("\nFile: %s    Line: %ld\n%s%s", display_path(d.file).c_str(), d.line,
                    d.source.c_str(), d.source.empty() ? "" : "\n");
}

// Lexes to the end, displaying each failure the log admits, then the count
// of those it did not.
void lex_and_display(Session &session, FailureLog &log, Warnings *warnings) {
    lex_all(
        session, log, warnings, [](const Session &) {},
        [](const Diagnostic &d, status_code) { display_failure(d); });
    if (log.hidden() > 0) std::printf("\n... %s\n", log.hidden_note().c_str());
}

int run_check(const Options &opt) {
    Session session;
    const int status = session.open(opt);
    if (status >= 0) return status;
    FailureLog log(opt.max_failures);
    Warnings warnings;
    lex_and_display(session, log, &warnings);
    // The end of a pass, as the parser ends it.
    if (dict_check() < 0) log.add_unprinted();
    const std::size_t warned = warnings.lines().size();
    if (warned > 0) std::printf("\n");
    for (const std::string &line : warnings.lines()) std::printf("%s\n", line.c_str());
    std::printf("\n%s: %lu failure%s", display_path(opt.file).c_str(), log.count(),
                log.count() == 1 ? "" : "s");
    if (warned > 0)
        std::printf(", %lu warning%s", static_cast<unsigned long>(warned), warned == 1 ? "" : "s");
    std::printf("\n");
    if (log.count() > 0 || (opt.strict && warned > 0)) return exit_failures;
    return exit_clean;
}

int run_dict(const Options &opt) {
    Session session;
    const int status = session.open(opt);
    if (status >= 0) return status;
    FailureLog log(opt.max_failures);
    lex_and_display(session, log, nullptr);
    // The listing waits for a key every ten lines only where someone sees
    // its prompt and can press one: a prompt in a file or a pipe is noise,
    // and a wait on a terminal whose output goes elsewhere looks like a hang.
    tplex_dict_list(opt.all ? 1 : 0, tool_isatty(0) != 0 && tool_isatty(1) != 0);
    return log.count() == 0 ? exit_clean : exit_failures;
}

// ---------------------------------------------------------------------------
// tplex table
// ---------------------------------------------------------------------------

// The whole of a file, or false when it cannot be read.
bool read_file(std::FILE *file, std::vector<std::uint8_t> &data) {
    std::uint8_t block[4096];
    std::size_t n;
    while ((n = std::fread(block, 1, sizeof block, file)) > 0)
        data.insert(data.end(), block, block + n);
    return std::ferror(file) == 0;
}

int run_table(const Options &opt) {
    // A file that cannot be opened is an I/O error (2), not a damaged table.
    const char *path = opt.file.c_str();
    const std::string reason = open_failure_reason(opt.file);
    std::FILE *file = reason.empty() ? std::fopen(path, "rb") : nullptr;
    if (file == nullptr) {
        std::fprintf(stderr, "%s: cannot open %s: %s\n", program, path,
                     reason.empty() ? std::strerror(errno) : reason.c_str());
        return exit_usage;
    }
    std::vector<std::uint8_t> data;
    const bool read = read_file(file, data);
    std::fclose(file);
    if (!read) {
        std::fprintf(stderr, "tplex table: cannot read '%s'\n", path);
        return exit_failures;
    }
    table_check check{};
    const bool sound = CheckTable(data.data(), data.size(), &check) != 0;
    if (sound) {
        std::printf("file: %s\n", path);
        print_table_summary(check, stdout);
    } else {
        std::fprintf(stderr, "tplex table: %s: %s\n", path, check.error);
    }
    ReleaseTableCheck(&check);
    return sound ? exit_clean : exit_failures;
}

// ---------------------------------------------------------------------------

const Command commands[] = {
    {"tokens", "tokens [--json] [-I DIR]... [-D NAME]... FILE",
     "Prints the token stream of FILE, one line per token:\n"
     "  FILE:LINE: KIND VALUE \"TEXT\"\n"
     "LINE is where the token ends. VALUE is '-' for kinds that carry none; an\n"
     "operator's TEXT is its spelling. A failure is one line too, with the\n"
     "position, code and message that sg_DisplayError gives:\n"
     "  FILE:LINE: FAILURE 0xd3470207 \"Bad Character\"\n"
     "and the stream goes on after it, as the lexer allows. Failures past the\n"
     "--max-failures limit are counted on standard error.\n"
     "\n"
     "  --json      one JSON object per line instead: {file, line, kind, name,\n"
     "              value, text} for a token, {file, line, failure, message,\n"
     "              source} for a failure. Strings are UTF-8: a byte that is\n"
     "              not part of well-formed UTF-8 is written as \\udcXX\n"
     "              (0xDC00 plus the byte), so it can be recovered\n",
     takes_lexing | takes_json, run_tokens},
    {"dict", "dict [--all] [-I DIR]... [-D NAME]... FILE",
     "Lexes FILE (declaring nothing; failures are printed as check prints\n"
     "them), then lists the symbol dictionary: slot, kind, name. The listing\n"
     "pauses for a key every ten lines when standard input and standard output\n"
     "are both terminals, and otherwise runs straight through with no prompt.\n"
     "\n"
     "  --all       list the reserved words and hash words too\n",
     takes_lexing | takes_all, run_dict},
    {"check", "check [--strict] [-I DIR]... [-D NAME]... FILE",
     "Lexes FILE once, as one pass of the compiler would, and prints each failure\n"
     "in the form sg_DisplayError gives it (a failure at the end of input shows\n"
     "the main file's last line), then warnings, then the number of failures.\n"
     "Warnings name what the language allows but is nearly always a mistake:\n"
     "  FILE:LINE: warning: #ifdef/#ifndef region still open at the end of input\n"
     "  FILE:LINE: warning: /* comment still open at the end of the file\n"
     "\n"
     "  --strict    warnings make the exit status 1, as failures do\n",
     takes_lexing | takes_strict, run_check},
    {"table", "table FILE",
     "Checks a table file written by the table output module, raw or as hex\n"
     "text: the header, the string table and every relocation entry. A sound\n"
     "file is summarised (header, body, strings, relocations); for a damaged one\n"
     "the reason is printed on standard error and the exit status is 1.\n",
     0, run_table},
};

}  // namespace

int run(int argc, char **argv) {
    if (argc < 2) {
        print_general_usage(stderr);
        return exit_usage;
    }
    const std::string first = argv[1];
    if (first == "-h" || first == "--help" || first == "help") {
        print_general_usage(stdout);
        return exit_clean;
    }
    if (first == "--version") {
        std::printf("tplex %s\n", TPLEX_VERSION_STRING);
        return exit_clean;
    }
    for (const Command &cmd : commands) {
        if (first != cmd.name) continue;
        Options opt;
        const int parsed = parse_options(cmd, argc - 2, argv + 2, opt);
        if (parsed >= 0) return parsed;
        return cmd.run(opt);
    }
    return usage_error(nullptr, "unknown command '" + first + "'");
}

// Whatever went to standard output must have arrived: a write that failed
// at any point (a full disk) leaves the stream's error flag set, and the
// last buffer is only written here.
int finish_output(int status) {
    errno = 0;
    const bool flushed = std::fflush(stdout) == 0;
    if (flushed && std::ferror(stdout) == 0) return status;
    std::fprintf(stderr, "%s: cannot write standard output%s%s\n", program,
                 flushed || errno == 0 ? "" : ": ",
                 flushed || errno == 0 ? "" : std::strerror(errno));
    return exit_usage;
}

}  // namespace tplex::tool

int main(int argc, char **argv) {
    return tplex::tool::finish_output(tplex::tool::run(argc, argv));
}
