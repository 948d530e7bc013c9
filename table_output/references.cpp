// Table output framing: opening the table file, references, the string
// store, and closing with the string and relocation tables.
#include "table_output/references.h"

#include <cstdio>
#include <cstring>

#include "base/memory.h"

namespace tplex {

table_output_state table_output{};

namespace {

output_stream_state &stream = output_stream;
table_output_state &table = table_output;

// The failure of most operations: close the file, tell, return the code.
status_code fail(status_code code, const char *message) {
    close_output_file();
    report("%s", message);
    return code;
}

status_code fail_id(status_code code, const char *format, std::uint32_t shown) {
    close_output_file();
    report(format, static_cast<int>(shown));
    return code;
}

void release_uses() {
    for (std::uint32_t i = 0; i < table.id_count; ++i) {
        for (reloc_record *use = table.relocatables[i].first_use; use != nullptr;) {
            reloc_record *next = use->next;
            mem_free(use);
            use = next;
        }
    }
}

// Leaves the store with one empty chunk, allocating it when there is none.
bool prepare_store() {
    string_store &store = table.store;
    if (store.first == nullptr) {
        store.first = new_chunk();
        if (store.first == nullptr) return false;
    } else {
        release_chunks(store.first->link);
    }
    store.first->link = nullptr;
    store.first->used = 0;
    store.current = store.first;
    store.total = 0;
    return true;
}

// Leaves the reference table allocated, cleared and with no id handed out.
bool prepare_relocatables() {
    if (table.relocatables == nullptr) {
        table.relocatables =
            static_cast<relocatable *>(mem_alloc(sizeof(relocatable) * max_references));
        if (table.relocatables == nullptr) return false;
    } else {
        release_uses();
    }
    std::memset(table.relocatables, 0, sizeof(relocatable) * max_references);
    table.id_count = 0;
    return true;
}

void set_out(std::uint32_t *out, std::uint32_t value) {
    if (out != nullptr) *out = value;
}

// The "can't open" refusal, told by the flags of this call.
status_code refuse_open(bool diagnostics, const char *name) {
    if (diagnostics) std::fprintf(stderr, "sg_TableOutput: can't open '%s'\n", name);
    return TPLEX_OUT_CANNOT_OPEN;
}

// Refuses a text that no chunk can hold (it and its NUL exceed 10000 bytes)
// with TPLEX_OUT_STRING_TOO_LONG before anything is written or allocated:
// the file stays open and the output usable, since nothing went wrong in it.
bool too_long(const char *text) {
    if (std::strlen(text) < chunk_size) return false;
    report("sg_TableOutput (StoreString): String too long\n");
    return true;
}

// Copies text into dest with escapes processed; returns the bytes stored,
// terminator included. Never stores more than strlen(text) + 1 bytes.
std::uint32_t copy_escaped(std::uint8_t *dest, const char *text) {
    std::uint32_t n = 0;
    for (const char *p = text; *p != '\0'; ++p) {
        char c = *p;
        if (c == '\\' && !stream.literal_backslash) {
            // A backslash just before the terminator is an escape without its
            // second character: stored as an unknown escape ('?'), and the
            // terminator is left to end the loop, so nothing past it is read.
            char next = p[1];
            if (next != '\0') ++p;
            c = next == '"' ? '"' : next == '\'' ? '\'' : next == 'n' ? '\n' : '?';
            if (c == '\n' && stream.drop_newlines) continue;
        }
        dest[n++] = static_cast<std::uint8_t>(c);
    }
    dest[n++] = 0;
    return n;
}

// The string table: every chunk's used bytes, until the total is reached.
status_code write_strings() {
    std::uint32_t written = 0;
    for (const byte_chunk *chunk = table.store.first; written < table.store.total;
         chunk = chunk->link) {
        if (chunk == nullptr) {
            return fail(TPLEX_OUT_STRING_TABLE_DAMAGED,
                        "sg_TableOutput: String table integrity damaged\n");
        }
        for (std::uint32_t i = 0; i < chunk->used; ++i) {
            status_code status = PutByte(chunk->data[i]);
            if (status != TPLEX_OK) return status;
        }
        written += chunk->used;
    }
    return TPLEX_OK;
}

// The relocation entries, id by id and use by use, each checked on the way.
status_code write_relocations(std::uint32_t s, std::uint32_t r) {
    for (std::uint32_t id = 1; id <= table.id_count; ++id) {
        const relocatable &entry = table.relocatables[id - 1];
        if (entry.first_use == nullptr) {
            return fail_id(TPLEX_OUT_UNUSED_REFERENCE,
                           "sg_TableOutput: Relocatable with no references %d\n", id - 1);
        }
        if (entry.target == 0) {
            return fail(TPLEX_OUT_UNDEFINED_REFERENCE,
                        "sg_TableOutput: Relocatable with no definition\n");
        }
        // Computed wide: a string position far beyond the table must not wrap
        // around to an offset below R.
        std::uint64_t target =
            entry.string_flag != 0 ? std::uint64_t{s} + entry.target - 1 : entry.target;
        for (const reloc_record *use = entry.first_use; use != nullptr; use = use->next) {
            if (use->offset >= r || target >= r) {
                return fail(TPLEX_OUT_OUT_OF_RANGE, "sg_TableOutput: Relocatable out of range\n");
            }
            status_code status = WriteUInt32(use->offset);
            if (status == TPLEX_OK) status = WriteUInt32(static_cast<std::uint32_t>(target));
            if (status != TPLEX_OK) return status;
        }
    }
    return TPLEX_OK;
}

// Flushes, seeks to the start and writes tag, length and R over the
// provisional header; in hex text mode the first 12 items have a fixed text
// length, so this rewrites them in place. Closes the file either way.
status_code rewrite_header(std::uint32_t r) {
    // Buffered bytes meet a full disk only here: report it, never success.
    if (std::fflush(stream.file) != 0) return fail_write();
    std::uint32_t length = stream.offset;
    stream.offset = 0;
    int result = std::fseek(stream.file, 0, SEEK_SET);
    if (result != 0) {
        // Always printed, on standard output, whatever the switches say.
        std::printf("sg_TableOutput: File seek failed - error = %d\n", result);
        std::fflush(stdout);
        close_output_file();
        return TPLEX_OUT_SEEK_FAILED;
    }
    status_code status = WriteUInt32(table.tag != 0 ? table.tag : 1);
    if (status == TPLEX_OK) status = WriteUInt32(length);
    if (status == TPLEX_OK) status = WriteUInt32(r);
    if (status != TPLEX_OK) return status;
    if (std::fflush(stream.file) != 0) return fail_write();
    std::FILE *file = stream.file;
    stream.file = nullptr;
    if (std::fclose(file) != 0) {
        report("sg_TableOutput: Fatal erorr: Write byte error\n");
        return TPLEX_OUT_WRITE_FAILED;
    }
    return TPLEX_OK;
}

}  // namespace

}  // namespace tplex

using tplex::output_stream;
using tplex::table_output;

extern "C" {

// Refusals come before anything changes, so an output whose file is still
// open keeps its switches and remembered name. Choices made here:
// - an output whose file is still open is neither closed nor replaced: the
//   new one is refused; an output whose file a failure already closed is
//   simply replaced (its partial file stays, as AbandonOutput was not asked);
// - a name of more than 199 characters is refused rather than cut, so the
//   remembered name is always the file's real name.
status_code OpenOutput(const char *name, uint32_t flags, uint32_t tag) {
    bool diagnostics = (flags & TPLEX_OUT_DIAGNOSTICS) != 0;
    if (output_stream.file != nullptr || name == nullptr ||
        std::strlen(name) >= tplex::output_name_size) {
        return tplex::refuse_open(diagnostics, name != nullptr ? name : "");
    }
    StopMemoryOutput();  // the table file's bytes belong in the file
    tplex::set_output_switches(flags);
    table_output.open = false;
    table_output.tag = tag;
    std::strcpy(table_output.name, name);

    output_stream.file = std::fopen(name, output_stream.hex_text ? "w+" : "w+b");
    if (output_stream.file == nullptr) return tplex::refuse_open(diagnostics, name);
    // The file exists before the tables: after these failures it stays, empty.
    if (!tplex::prepare_store()) {
        return tplex::fail(TPLEX_OUT_NO_MEMORY_TABLES,
                           "sg_TableOutput: Failed to malloc StringStore\n");
    }
    if (!tplex::prepare_relocatables()) {
        return tplex::fail(TPLEX_OUT_NO_MEMORY_TABLES,
                           "sg_TableOutput: Failed to malloc relocatables\n");
    }
    table_output.open = true;
    tplex::begin_stream();
    status_code status = WriteUInt32(tag != 0 ? tag : 1);
    for (int i = 0; i < 3 && status == TPLEX_OK; ++i) status = WriteUInt32(tplex::header_word);
    return status;
}

// Without a table (before OpenOutput or after FreeOutputTables) no id can be
// handed out: it fails like a full table instead of indexing nothing.
status_code AllocateReference(uint32_t *out_id) {
    tplex::set_out(out_id, 0);
    if (table_output.relocatables == nullptr || table_output.id_count == tplex::max_references) {
        return tplex::fail(TPLEX_OUT_TOO_MANY_REFERENCES,
                           "sg_TableOutput (StoreString): Failed to allocate reference\n");
    }
    tplex::set_out(out_id, ++table_output.id_count);
    return TPLEX_OK;
}

status_code CreateReference(uint32_t id, uint32_t offset) {
    if (id == 0 || id > table_output.id_count) {
        return tplex::fail_id(TPLEX_OUT_BAD_USE_ID,
                              "sg_TableOutput: Illegal cross reference id %d\n", id);
    }
    auto *use = static_cast<tplex::reloc_record *>(tplex::mem_alloc(sizeof(tplex::reloc_record)));
    if (use == nullptr) {
        return tplex::fail(TPLEX_OUT_NO_MEMORY_RELOC,
                           "sg_TableOutput (CreateReference): Failed to malloc reloc record\n");
    }
    use->next = nullptr;
    use->offset = offset;
    tplex::relocatable &entry = table_output.relocatables[id - 1];
    if (entry.first_use == nullptr) {
        entry.first_use = use;
    } else {
        entry.last_use->next = use;
    }
    entry.last_use = use;
    return TPLEX_OK;
}

status_code SetReferenceTarget(uint32_t id, uint32_t target, uint32_t string_flag) {
    if (id == 0 || id > table_output.id_count) {
        return tplex::fail_id(TPLEX_OUT_BAD_TARGET_ID,
                              "sg_TableOutput: Illegal cross reference id %d\n", id);
    }
    tplex::relocatable &entry = table_output.relocatables[id - 1];
    if (entry.target != 0) {
        return tplex::fail_id(TPLEX_OUT_DOUBLE_DEFINITION,
                              "sg_TableOutput: Double definition of reference %d\n", id - 1);
    }
    entry.target = target;
    entry.string_flag = string_flag;
    return TPLEX_OK;
}

status_code DefineReference(uint32_t id, uint32_t offset) {
    return SetReferenceTarget(id, offset, 0);
}

status_code DefineReferenceHere(uint32_t *out_id, uint32_t id, uint32_t align) {
    tplex::set_out(out_id, 0);
    status_code status = id == 0 ? AllocateReference(&id) : TPLEX_OK;
    if (status == TPLEX_OK && output_stream.align && (align & 1u) != 0) status = tplex::fill_to(4);
    if (status == TPLEX_OK) status = DefineReference(id, output_stream.offset);
    if (status == TPLEX_OK) tplex::set_out(out_id, id);
    return status;
}

status_code WriteReference(uint32_t *out_id, uint32_t id) {
    tplex::set_out(out_id, 0);
    status_code status = id == 0 ? AllocateReference(&id) : TPLEX_OK;
    if (status == TPLEX_OK && output_stream.align) status = tplex::fill_to(4);
    if (status == TPLEX_OK) status = CreateReference(id, output_stream.offset);
    if (status == TPLEX_OK) status = WriteUInt32(tplex::plain_placeholder);
    if (status == TPLEX_OK) tplex::set_out(out_id, id);
    return status;
}

status_code StoreString(const char *text) {
    if (text == nullptr) text = "";
    if (tplex::too_long(text)) return TPLEX_OUT_STRING_TOO_LONG;
    uint32_t id = 0;
    uint32_t position = 0;
    status_code status = output_stream.align ? tplex::fill_to(4) : TPLEX_OK;
    if (status == TPLEX_OK) status = AllocateReference(&id);
    if (status == TPLEX_OK) status = CreateReference(id, output_stream.offset);
    if (status == TPLEX_OK) status = WriteUInt32(tplex::string_placeholder);
    if (status == TPLEX_OK) status = AddToStringStore(&position, text);
    if (status == TPLEX_OK) status = SetReferenceTarget(id, position, 1);
    return status;
}

// Each string lies whole in one chunk: a text that does not fit in the rest
// of the current chunk starts a new one (the room test uses the length before
// escapes, which only shorten). A store without chunks gets its first here.
status_code AddToStringStore(uint32_t *out_position, const char *text) {
    tplex::set_out(out_position, 0);
    if (text == nullptr) text = "";
    if (tplex::too_long(text)) return TPLEX_OUT_STRING_TOO_LONG;
    tplex::string_store &store = table_output.store;
    uint32_t needed = static_cast<uint32_t>(std::strlen(text)) + 1;
    if (store.current == nullptr || needed > tplex::chunk_size - store.current->used) {
        tplex::byte_chunk *chunk = tplex::new_chunk();
        if (chunk == nullptr) {
            return tplex::fail(TPLEX_OUT_NO_MEMORY_CHUNK,
                               "sg_TableOutput (StoreString): Failed to malloc StringStore\n");
        }
        if (store.current == nullptr) {
            store.first = chunk;
        } else {
            store.current->link = chunk;
        }
        store.current = chunk;
    }
    uint32_t start = store.total;
    uint32_t stored = tplex::copy_escaped(store.current->data + store.current->used, text);
    store.current->used += stored;
    store.total += stored;
    tplex::set_out(out_position, start + 1);
    return TPLEX_OK;
}

// Strings, relocations, header. Closing nothing is TPLEX_OUT_NOT_OPEN rather
// than bytes sent nowhere; an output whose file a failure closed stays failed.
status_code CloseOutput(void) {
    if (!table_output.open) return TPLEX_OUT_NOT_OPEN;
    if (output_stream.file == nullptr) return TPLEX_OUT_WRITE_FAILED;  // closed by a failure
    status_code status = tplex::fill_to(4);
    uint32_t s = output_stream.offset;
    if (status == TPLEX_OK) status = tplex::write_strings();
    if (status == TPLEX_OK) status = tplex::fill_to(4, 0x00);
    uint32_t r = output_stream.offset;
    if (status == TPLEX_OK) status = tplex::write_relocations(s, r);
    if (status == TPLEX_OK) status = tplex::rewrite_header(r);
    if (status == TPLEX_OK) table_output.open = false;
    return status;
}

status_code AbandonOutput(uint32_t free_tables) {
    if (!table_output.open) return TPLEX_OUT_NOT_OPEN;
    tplex::close_output_file();  // does nothing when a failure already closed it
    std::remove(table_output.name);
    table_output.open = false;
    if (free_tables != 0) FreeOutputTables();
    return TPLEX_OK;
}

status_code FreeOutputTables(void) {
    // The output file is not touched: an output still being written goes
    // on without the references and strings made so far. Later ones cannot
    // reach the freed tables: with no table no id is handed out, and a
    // string gets a new first chunk.
    tplex::release_chunks(table_output.store.first);
    table_output.store = tplex::string_store{};
    if (table_output.relocatables != nullptr) {
        tplex::release_uses();
        tplex::mem_free(table_output.relocatables);
        table_output.relocatables = nullptr;
    }
    table_output.id_count = 0;
    return TPLEX_OK;
}

}  // extern "C"
