// tplex: the lexer's command-line tool. It drives the library through its
// exported functions in the order the compiler's parser does (sc_lex_init,
// sc_lex_setup, sc_lex_init_defines, sc_lex_init_file, sc_next_token until
// the end of input, sg_closesources, lex_free) and shows what it delivers.
//
// tplex table checks a table file with the table output module's checker.
//
// Exit status: 0 the input lexed without a failure (a sound table file),
// 1 the input had failures (a damaged table file), 2 a usage error or a
// file or option that the lexer refused.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#ifdef _WIN32
#include <io.h>
#define tool_isatty _isatty
#define TOOL_NULL_DEVICE "NUL"
#else
#include <unistd.h>
#define tool_isatty isatty
#define TOOL_NULL_DEVICE "/dev/null"
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

const char *const program = "tplex";

// ---------------------------------------------------------------------------
// Command line
// ---------------------------------------------------------------------------

struct Options {
    std::vector<std::string> include_dirs;  // -I, in order
    std::vector<std::string> defines;       // -D, in order
    std::string file;
    bool json = false;  // tokens --json
    bool all = false;   // dict --all
};

// What a command accepts besides FILE.
enum CommandOptions : unsigned {
    takes_lexing = 1,  // -I and -D
    takes_json = 2,    // --json
    takes_all = 4,     // --all
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
    "  -D NAME     predefine NAME, as #define NAME would (case does not matter)\n";
const char *const help_option = "  -h, --help  show this help\n";

void print_general_usage(std::FILE *out) {
    std::fprintf(out,
                 "usage: tplex tokens [--json] [-I DIR]... [-D NAME]... FILE\n"
                 "       tplex dict [--all] [-I DIR]... [-D NAME]... FILE\n"
                 "       tplex check [-I DIR]... [-D NAME]... FILE\n"
                 "       tplex table FILE\n"
                 "       tplex --version | --help\n"
                 "\n"
                 "Drives the tplex lexer over FILE as the template compiler's parser does.\n"
                 "\n"
                 "  tokens   print the token stream, one token or failure per line\n"
                 "  dict     lex FILE, then list the symbol dictionary\n"
                 "  check    lex FILE once, print each failure and their number\n"
                 "  table    check a table file (raw or hex text) and summarise it\n"
                 "\n"
                 "Run 'tplex COMMAND --help' for the options of a command.\n"
                 "Exit status: 0 no failure, 1 the input had failures, 2 usage or I/O error.\n");
}

int usage_error(const char *command, const std::string &what) {
    std::fprintf(stderr, "%s: %s\n", program, what.c_str());
    if (command != nullptr)
        std::fprintf(stderr, "Run '%s %s --help' for its usage.\n", program, command);
    else
        std::fprintf(stderr, "Run '%s --help' for usage.\n", program);
    return exit_usage;
}

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
        if (init < 0) return io_error("cannot initialise the lexer", init);
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
        if (opened < 0) return io_error("cannot open " + opt.file, opened);
        main_file_ = opt.file;
        for (const std::string &dir : opt.include_dirs) {
            const status_code added = ::add_include_dir(dir.c_str());
            if (added < 0) return io_error("-I " + dir, added);
        }
        return -1;
    }

    const token_record &token() const { return *token_; }

    // Where the token just delivered ends: the file being read and its line.
    // At the end of input no file is open any more: the main file's last line.
    std::string file() const { return *depth_ >= 1 ? frames_[*depth_].path : main_file_; }
    unsigned long line() const {
        const source_frame &f = frames_[*depth_ >= 1 ? *depth_ : 1];
        return static_cast<std::uint32_t>(f.line_no + 1u);
    }

private:
    int io_error(const std::string &what, status_code code) {
        const Diagnostic d = diagnostic_of(code);
        std::fprintf(stderr, "%s: %s: %s\n", program, what.c_str(), d.message.c_str());
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
    bool note_failure(status_code code, const std::string &file, long line) {
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
    long line_ = 0;
    unsigned long count_ = 0;
};

void report_stuck(const std::string &file, long line) {
    std::fflush(stdout);
    std::fprintf(stderr, "%s: %s:%ld: the same failure came %lu times without progress; stopped\n",
                 program, file.c_str(), line, stuck_limit);
}

// Runs sc_next_token to the end of input. on_token sees every token (the
// end of input included), on_failure every failure with its diagnostic.
// Returns the number of failures.
template <typename OnToken, typename OnFailure>
unsigned long lex_all(Session &session, OnToken on_token, OnFailure on_failure) {
    StuckGuard guard;
    unsigned long failures = 0;
    for (;;) {
        const status_code r = sc_next_token();
        if (r < 0) {
            ++failures;
            std::string file;
            long line = 0;
            on_failure(r, file, line);
            if (!guard.note_failure(r, file, line)) {
                report_stuck(file, line);
                break;
            }
            continue;
        }
        guard.note_token();
        on_token(session);
        if (r == tk_end_of_input) break;
    }
    return failures;
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
    if (json) {
        std::printf("{\"file\":%s,\"line\":%lu,\"kind\":%u,\"name\":%s,\"value\":%s,\"text\":%s}\n",
                    json_string(s.file()).c_str(), s.line(), static_cast<unsigned>(t.kind),
                    json_string(kind_name(t.kind)).c_str(),
                    has_value ? std::to_string(t.value).c_str() : "null",
                    json_string(token_text(t)).c_str());
    } else {
        std::printf("%s:%lu: %-15s %11s %s\n", s.file().c_str(), s.line(),
                    kind_name(t.kind).c_str(), has_value ? std::to_string(t.value).c_str() : "-",
                    quoted(token_text(t)).c_str());
    }
}

void print_failure(const Diagnostic &d, status_code code, bool json) {
    if (json) {
        std::printf("{\"file\":%s,\"line\":%ld,\"failure\":%s,\"message\":%s,\"source\":%s}\n",
                    json_string(d.file).c_str(), d.line, json_string(hex_code(code)).c_str(),
                    json_string(d.message).c_str(), json_string(d.source).c_str());
    } else {
        std::printf("%s:%ld: %-15s %11s %s\n", d.file.c_str(), d.line, "FAILURE",
                    hex_code(code).c_str(), quoted(d.message).c_str());
    }
}

int run_tokens(const Options &opt) {
    Session session;
    const int status = session.open(opt);
    if (status >= 0) return status;
    const unsigned long failures = lex_all(
        session, [&](const Session &s) { print_token(s, opt.json); },
        [&](status_code code, std::string &file, long &line) {
            Diagnostic d = diagnostic_of(code);
            // A code shown without a position, or with none to show because
            // no file is open any more: where the lexer is.
            if (!d.has_position || d.file.empty()) {
                d.file = session.file();
                d.line = static_cast<long>(session.line());
            }
            print_failure(d, code, opt.json);
            file = d.file;
            line = d.line;
        });
    std::fflush(stdout);
    return failures == 0 ? exit_clean : exit_failures;
}

// ---------------------------------------------------------------------------
// tplex check and tplex dict
// ---------------------------------------------------------------------------

// Prints each failure as sg_DisplayError does.
unsigned long lex_and_display(Session &session) {
    return lex_all(
        session, [](const Session &) {},
        [&](status_code code, std::string &file, long &line) {
            sg_DisplayError(code);
            file = session.file();
            line = static_cast<long>(session.line());
        });
}

int run_check(const Options &opt) {
    Session session;
    const int status = session.open(opt);
    if (status >= 0) return status;
    unsigned long failures = lex_and_display(session);
    // The end of a pass, as the parser ends it.
    if (dict_check() < 0) ++failures;
    std::printf("\n%s: %lu failure%s\n", opt.file.c_str(), failures, failures == 1 ? "" : "s");
    std::fflush(stdout);
    return failures == 0 ? exit_clean : exit_failures;
}

int run_dict(const Options &opt) {
    // The listing waits for a key every ten lines; with no terminal to
    // press one on, standard input reads as empty and the wait ends at once.
    if (!tool_isatty(0) && std::freopen(TOOL_NULL_DEVICE, "r", stdin) == nullptr) {
        std::fprintf(stderr, "%s: cannot reopen standard input from %s\n", program,
                     TOOL_NULL_DEVICE);
        return exit_usage;
    }
    Session session;
    const int status = session.open(opt);
    if (status >= 0) return status;
    const unsigned long failures = lex_and_display(session);
    ::dict_list(opt.all ? 1 : 0);
    std::fflush(stdout);
    return failures == 0 ? exit_clean : exit_failures;
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
    std::FILE *file = std::fopen(path, "rb");
    if (file == nullptr) {
        std::fprintf(stderr, "%s: cannot open %s: %s\n", program, path, std::strerror(errno));
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
    std::fflush(stdout);
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
     "and the stream goes on after it, as the lexer allows.\n"
     "\n"
     "  --json      one JSON object per line instead: {file, line, kind, name,\n"
     "              value, text} for a token, {file, line, failure, message,\n"
     "              source} for a failure\n",
     takes_lexing | takes_json, run_tokens},
    {"dict", "dict [--all] [-I DIR]... [-D NAME]... FILE",
     "Lexes FILE (declaring nothing; failures are printed as sg_DisplayError\n"
     "prints them), then lists the symbol dictionary: slot, kind, name. The\n"
     "listing pauses for a key every ten lines when standard input is a terminal.\n"
     "\n"
     "  --all       list the reserved words and hash words too\n",
     takes_lexing | takes_all, run_dict},
    {"check", "check [-I DIR]... [-D NAME]... FILE",
     "Lexes FILE once, as one pass of the compiler would, prints each failure as\n"
     "sg_DisplayError prints it, then the number of failures.\n",
     takes_lexing, run_check},
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

}  // namespace tplex::tool

int main(int argc, char **argv) {
    return tplex::tool::run(argc, argv);
}
