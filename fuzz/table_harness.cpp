#include "table_harness.h"

#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "base/memory.h"
#include "harness_support.h"
#include "table_output/output_stream.h"
#include "tplex/table_output.h"

namespace tplex::fuzz {

namespace {

constexpr int step_limit = 2000;
constexpr const char *out_name = "out.tbl";

// TPLEX_FUZZ_TRACE=1 in the environment prints each call on standard error.
const bool tracing = std::getenv("TPLEX_FUZZ_TRACE") != nullptr;

// A result of the module: 0 or one of its codes.
std::int32_t out_status(const char *call, std::int32_t r) {
    if (tracing) std::fprintf(stderr, "%-20s -> %x\n", call, static_cast<unsigned>(r));
    const auto u = static_cast<std::uint32_t>(r);
    TPLEX_FUZZ_CHECK(r == 0 || (u >= 0xD347000Bu && u <= 0xD347001Cu), r);
    return r;
}

std::string read_all(const char *name) {
    std::string data;
    std::FILE *f = std::fopen(name, "rb");
    TPLEX_FUZZ_CHECK(f != nullptr, 0);
    char buf[65536];
    for (std::size_t n; (n = std::fread(buf, 1, sizeof buf, f)) > 0;) data.append(buf, n);
    std::fclose(f);
    return data;
}

// The checker's walk of a table it accepted: every entry and string lies
// inside the table.
void walk_sound_table(const table_check &check) {
    TPLEX_FUZZ_CHECK(check.relocation_offset <= check.size, check.relocation_offset);
    TPLEX_FUZZ_CHECK(
        std::uint64_t{check.relocation_count} * 8 <= check.size - check.relocation_offset,
        check.relocation_count);
    for (std::uint32_t i = 0; i < check.relocation_count; ++i) {
        const table_relocation r = TableRelocationAt(&check, i);
        TPLEX_FUZZ_CHECK(r.location < check.relocation_offset, r.location);
        TPLEX_FUZZ_CHECK(r.target < check.relocation_offset, r.target);
        if (!r.is_string) continue;
        const char *s = TableStringAt(&check, r.target);
        TPLEX_FUZZ_CHECK(std::memchr(s, 0, check.size - r.target) != nullptr, r.target);
    }
}

// The state the script runs against.
struct output_model {
    std::uint32_t flags = 0;
    std::uint32_t tag = 0;
    bool open = false;               // between a successful OpenOutput and its end
    std::uint32_t uses = 0;          // references written since it opened
    std::vector<std::uint32_t> ids;  // ids handed out, to be used again
};

std::uint32_t pick_id(script_reader &s, const output_model &m) {
    const std::uint8_t b = s.byte();
    if (b < 0x40) return 0;  // a new id
    if (b < 0xF0 && !m.ids.empty()) return m.ids[b % m.ids.size()];
    return b == 0xFF ? s.u32() : b & 15u;
}

void note_id(output_model &m, std::uint32_t id) {
    if (id != 0 && m.ids.size() < 64) m.ids.push_back(id);
}

std::string pick_string(script_reader &s) {
    const std::uint8_t b = s.byte();
    if (b == 0xFF) return std::string(9999, 's');   // fills a chunk by itself
    if (b == 0xFE) return std::string(10000, 'l');  // fits no chunk
    if (b == 0xFD) return "tail\\";                 // an escape cut short
    return s.text(b % 64);
}

void open_output(output_model &m) {
    const std::int32_t r = out_status("OpenOutput", OpenOutput(out_name, m.flags, m.tag));
    // Refused (TPLEX_OUT_CANNOT_OPEN: the name is always one that opens)
    // while a file is open for writing; otherwise an output whose file a
    // failure closed is replaced, whether the new one opens or not.
    if (r == TPLEX_OUT_CANNOT_OPEN) return;
    m.open = r == 0;
    m.uses = 0;
    m.ids.clear();
}

// Ends the output as the model says; a complete file must check sound.
void close_output(output_model &m) {
    const std::int32_t r = out_status("CloseOutput", CloseOutput());
    if (!m.open) {
        TPLEX_FUZZ_CHECK(r != 0, r);
        return;
    }
    if (r != 0) return;  // failed: the output still counts as open
    m.open = false;
#ifdef TPLEX_ALLOC_HOOK
    mem_fail_at(0);  // the checker's own allocations are not under test
#endif
    const std::string data = read_all(out_name);
    if (tracing)
        std::fprintf(stderr, "table file of %zu bytes:\n%.*s\n", data.size(),
                     static_cast<int>(data.size() < 400 ? data.size() : 400), data.c_str());
    table_check check{};
    const bool sound =
        CheckTable(reinterpret_cast<const std::uint8_t *>(data.data()), data.size(), &check);
    if (!sound) std::fprintf(stderr, "table checker: %s\n", check.error);
    TPLEX_FUZZ_CHECK(sound, data.size());
    TPLEX_FUZZ_CHECK(check.hex_text == ((m.flags & TPLEX_OUT_HEX_TEXT) != 0), check.hex_text);
    TPLEX_FUZZ_CHECK(check.tag == (m.tag == 0 ? 1 : m.tag), check.tag);
    TPLEX_FUZZ_CHECK(check.relocation_count == m.uses, check.relocation_count);
    walk_sound_table(check);
    ReleaseTableCheck(&check);
}

void abandon_output(output_model &m, std::uint32_t free_tables) {
    const std::int32_t r = out_status("AbandonOutput", AbandonOutput(free_tables));
    TPLEX_FUZZ_CHECK(m.open ? r == 0 : r == TPLEX_OUT_NOT_OPEN, r);
    if (r == 0) TPLEX_FUZZ_CHECK(::access(out_name, F_OK) != 0, 0);  // the file is gone
    m.open = false;
}

void memory_call(script_reader &s) {
    switch (s.byte() % 5) {
        case 0:
            out_status("StartMemoryOutput", StartMemoryOutput());
            break;
        case 1:
            TPLEX_FUZZ_CHECK(StopMemoryOutput() == 0, 0);
            break;
        case 2:
            TPLEX_FUZZ_CHECK(FreeMemoryOutput() == 0, 0);
            break;
        default: {
            const std::uint32_t size = MemoryOutputSize();
            std::vector<std::uint8_t> buf(s.byte() % 2 == 0 ? size : size / 2);
            const std::uint32_t n =
                CopyMemoryOutput(buf.data(), static_cast<std::uint32_t>(buf.size()));
            TPLEX_FUZZ_CHECK(n == buf.size(), n);
            break;
        }
    }
}

void rare_call(script_reader &s, output_model &m) {
    switch (s.byte() % 8) {
        case 0:
#ifdef TPLEX_ALLOC_HOOK
            mem_fail_at(s.byte() + 1u);
#endif
            break;
        case 1:
            memory_call(s);
            break;
        case 2:
            close_output(m);
            break;
        case 3:
            abandon_output(m, s.byte() & 1);
            break;
        case 4:
            open_output(m);
            break;
        case 5:  // an open output goes on without the references made so far
            TPLEX_FUZZ_CHECK(FreeOutputTables() == 0, 0);
            m.uses = 0;
            m.ids.clear();
            break;
        case 6: {  // runs out of reference ids
            std::uint32_t id = 0;
            for (int i = 0;
                 i < 50001 && out_status("AllocateReference", AllocateReference(&id)) == 0; ++i) {
            }
            break;
        }
        default: {
            std::uint32_t pos = 0;
            const std::string text = pick_string(s);
            if (out_status("AddToStringStore", AddToStringStore(&pos, text.c_str())) != 0)
                TPLEX_FUZZ_CHECK(pos == 0, pos);
            break;
        }
    }
}

void step(script_reader &s, output_model &m) {
    std::uint32_t id = 0;
    switch (s.byte() % 16) {
        case 0:
            out_status("WriteUInt8", WriteUInt8(s.byte()));
            break;
        case 1:
            out_status("WriteInt8", WriteInt8(static_cast<std::int8_t>(s.byte())));
            break;
        case 2:
            out_status("WriteUInt16", WriteUInt16(s.u16()));
            break;
        case 3:
            out_status("WriteInt16", WriteInt16(static_cast<std::int16_t>(s.u16())));
            break;
        case 4:
            out_status("WriteUInt32", WriteUInt32(s.u32()));
            break;
        case 5:
            out_status("WriteInt32", WriteInt32(static_cast<std::int32_t>(s.u32())));
            break;
        case 6:
            out_status("PutByte", PutByte(s.byte()));
            break;
        case 7:
            out_status("AlignOutput", AlignOutput(s.byte() % 9));
            break;
        case 8:
            out_status("BeginBlock", BeginBlock());
            break;
        case 9:
            out_status("EndBlock", EndBlock());
            break;
        case 10:
            if (out_status("WriteReference", WriteReference(&id, pick_id(s, m))) == 0) {
                ++m.uses;
                note_id(m, id);
            }
            break;
        case 11:
            if (out_status("DefineReferenceHere",
                           DefineReferenceHere(&id, pick_id(s, m), s.byte())) == 0)
                note_id(m, id);
            break;
        case 12: {
            const std::uint32_t target = pick_id(s, m);
            const std::uint8_t how = s.byte();
            const std::uint32_t offset = how < 0x80 ? s.byte() * 4u : s.u32();
            out_status("Define/SetTarget", (how & 1) != 0
                                               ? DefineReference(target, offset)
                                               : SetReferenceTarget(target, offset, how & 2));
            break;
        }
        case 13:
            if (out_status("StoreString", StoreString(pick_string(s).c_str())) == 0) ++m.uses;
            break;
        case 14:
            if ((s.byte() & 1) != 0) {
                if (out_status("AllocateReference", AllocateReference(&id)) == 0) note_id(m, id);
            } else {
                // A use made by hand, as WriteReference makes it: recorded at
                // the offset where its placeholder then goes.
                const std::uint32_t target = pick_id(s, m);
                if ((m.flags & TPLEX_OUT_ALIGN) != 0) out_status("AlignOutput", AlignOutput(4));
                if (out_status("CreateReference", CreateReference(target, output_stream.offset)) ==
                    0) {
                    ++m.uses;
                    out_status("WriteUInt32", WriteUInt32(0xA5A5A5A5u));
                }
            }
            break;
        default:
            rare_call(s, m);
            break;
    }
}

}  // namespace

void run_table_output(const std::uint8_t *data, std::size_t size) {
    const in_work_dir here;
    const fd_set_snapshot fds_before = open_fds();
    script_reader s(data, size);
    output_model m;
    const std::uint8_t f = s.byte();
    // Diagnostics only now and then: they are lines on standard error.
    m.flags = (f & 0x17u) | (f >= 0xF8u ? TPLEX_OUT_DIAGNOSTICS : 0u);
    m.tag = (f & 0x20u) != 0 ? s.u32() : 0;
    const std::uint8_t ending = s.byte();
    open_output(m);
    for (int steps = 0; steps < step_limit && !s.done(); ++steps) step(s, m);
#ifdef TPLEX_ALLOC_HOOK
    mem_fail_at(0);
#endif
    if ((ending & 1) == 0) close_output(m);
    if (m.open) abandon_output(m, ending & 2);
    TPLEX_FUZZ_CHECK(AbandonOutput(1) == TPLEX_OUT_NOT_OPEN, 0);
    TPLEX_FUZZ_CHECK(FreeOutputTables() == 0, 0);
    TPLEX_FUZZ_CHECK(FreeMemoryOutput() == 0, 0);
    ::unlink(out_name);
    TPLEX_FUZZ_CHECK(open_fds() == fds_before, 0);
}

void run_table_check(const std::uint8_t *data, std::size_t size) {
    // An exact copy on the heap: a read past the end is caught.
    std::vector<std::uint8_t> bytes(data, data + size);
    table_check check{};
    if (CheckTable(bytes.data(), bytes.size(), &check)) {
        walk_sound_table(check);
    } else {
        TPLEX_FUZZ_CHECK(check.error[0] != '\0', 0);
        TPLEX_FUZZ_CHECK(terminated(check.error, sizeof check.error), 0);
    }
    ReleaseTableCheck(&check);
}

}  // namespace tplex::fuzz
