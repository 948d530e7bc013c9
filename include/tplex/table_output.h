/*
 * tplex table output: writes a compiler's generated tables as one table
 * file with forward references, a string table and a relocation table.
 *
 * These operations live in the static archive (libtplex.a) with C linkage;
 * the shared library does not export them. One output at a time per process.
 * Every operation returns 0 or a negative status code (TPLEX_OUT_* in
 * tplex/lexer.h).
 *
 * The table file, all integers u32 little-endian:
 *   0   tag (1 when OpenOutput was given 0)
 *   4   file length          (60 until CloseOutput has finished)
 *   8   R, relocation table   (60 until CloseOutput has finished)
 *   12  60
 *   16  body: every byte written, fill bytes 0x3C and placeholders included
 *   S   string table (S a multiple of 4), then 0x00 up to a multiple of 4
 *   R   relocation entries of 8 bytes: location, target
 * Each use of a reference is a placeholder in the body (0xA5A5A5A5 for a
 * plain reference, 0x4B4B4B4B for a string); its relocation entry says
 * which offset it stands for. In hex text mode the same bytes are written as
 * " 0x%02x" items separated by ",", sixteen to a line.
 */
#ifndef TPLEX_TABLE_OUTPUT_H
#define TPLEX_TABLE_OUTPUT_H

#include "tplex/lexer.h"

#ifdef __cplusplus
extern "C" {
#endif

/* ------------------------------------------------------------------------ */
/* Flags of OpenOutput()                                                    */
/* ------------------------------------------------------------------------ */

#define TPLEX_OUT_ALIGN 0x01u             /* align 16-bit values to 2, 32-bit values to 4 */
#define TPLEX_OUT_HEX_TEXT 0x02u          /* write the file as hexadecimal text */
#define TPLEX_OUT_DROP_NEWLINES 0x04u     /* StoreString drops the backslash-n escape */
#define TPLEX_OUT_DIAGNOSTICS 0x08u       /* print failure messages on standard error */
#define TPLEX_OUT_LITERAL_BACKSLASH 0x10u /* StoreString keeps backslashes as they are */

/* ------------------------------------------------------------------------ */
/* Opening, closing and the tables                                          */
/* ------------------------------------------------------------------------ */

/* Creates (or empties) the table file and writes its provisional header.
 * TPLEX_OUT_CANNOT_OPEN when the file cannot be opened, when the name is
 * null or longer than 199 characters, or while an earlier output still has
 * its file open (that output is left untouched: finish or abandon it first).
 * TPLEX_OUT_NO_MEMORY_TABLES when the string store or the reference table
 * cannot be allocated; the empty file then stays on disk. Memory output, if
 * on, is switched off first (its bytes stay readable). */
status_code OpenOutput(const char *name, uint32_t flags, uint32_t tag);
/* Appends the string table and the relocation table and rewrites the header;
 * the output is then closed. On failure the file is closed but the output
 * still counts as open, so AbandonOutput can delete the partial file.
 * TPLEX_OUT_NOT_OPEN when no output is open; TPLEX_OUT_WRITE_FAILED when an
 * earlier failure has already closed the file or the final flush fails. */
status_code CloseOutput(void);
/* Closes (unless a failure already did) and deletes the table file; with
 * free_tables non-zero also FreeOutputTables(). TPLEX_OUT_NOT_OPEN, doing
 * nothing, when no output is open. */
status_code AbandonOutput(uint32_t free_tables);
/* Releases the string store and the reference table; always 0. The output
 * file is not touched: an output still open goes on without the references
 * and strings made so far (no further reference id can be handed out until
 * the next OpenOutput). */
status_code FreeOutputTables(void);

/* ------------------------------------------------------------------------ */
/* The byte stream                                                          */
/* ------------------------------------------------------------------------ */

/* Each writer fills first (alignment switch on: 16-bit values to an even
 * offset, 32-bit values to a multiple of 4, with 0x3C), then writes its bytes
 * lowest first. TPLEX_OUT_WRITE_FAILED when a byte cannot reach the file, or
 * when no file is open for writing. */
status_code WriteInt8(int8_t v);
status_code WriteUInt8(uint8_t v);
status_code WriteInt16(int16_t v);
status_code WriteUInt16(uint16_t v);
status_code WriteInt32(int32_t v);
status_code WriteUInt32(uint32_t v);
/* The one path of every byte to the file, or to memory output when it is on. */
status_code PutByte(uint8_t b);
/* Fills with 0x3C to a multiple of 2 (boundary 2) or 4 (any other boundary),
 * whatever the alignment switch says. */
status_code AlignOutput(uint32_t boundary);
/* Opens a block at the current offset; TPLEX_OUT_TOO_MANY_BLOCKS with 100 open. */
status_code BeginBlock(void);
/* Fills the innermost block with 0x3C to 0, 4, 8 or a multiple of 16 bytes;
 * TPLEX_OUT_NO_OPEN_BLOCK when none is open. */
status_code EndBlock(void);

/* ------------------------------------------------------------------------ */
/* References and strings                                                   */
/* ------------------------------------------------------------------------ */

/* Out parameters may be null; they are set to 0 on failure. */

/* Hands out the next reference id (1 to 50000); TPLEX_OUT_TOO_MANY_REFERENCES
 * beyond that or before the tables exist. */
status_code AllocateReference(uint32_t *out_id);
/* Records a use of id at offset. */
status_code CreateReference(uint32_t id, uint32_t offset);
/* Gives id its target: an offset, or a string's 1-based position in the
 * string table when string_flag is non-zero. */
status_code SetReferenceTarget(uint32_t id, uint32_t target, uint32_t string_flag);
status_code DefineReference(uint32_t id, uint32_t offset);
/* Defines id (0: a new id) as the current offset, after filling to 4 when the
 * alignment switch is on and bit 0 of align is set. */
status_code DefineReferenceHere(uint32_t *out_id, uint32_t id, uint32_t align);
/* Writes a placeholder that stands for id (0: a new id). */
status_code WriteReference(uint32_t *out_id, uint32_t id);
/* Writes a string reference and stores the text (escapes processed).
 * TPLEX_OUT_STRING_TOO_LONG, with nothing written or stored, for a text of
 * 10000 characters or more. A null text stores an empty string. */
status_code StoreString(const char *text);
/* Stores a text in the string store and gives its 1-based position. */
status_code AddToStringStore(uint32_t *out_position, const char *text);

/* ------------------------------------------------------------------------ */
/* Memory output                                                            */
/* ------------------------------------------------------------------------ */

/* Memory output builds a byte image in memory instead of a table file: while
 * it is on, PutByte (and so every writer, AlignOutput and EndBlock) appends
 * to a chain of 10000-byte chunks. It is a stream of its own: it starts at
 * output offset 0 and every byte it takes advances the offset, so alignment
 * and blocks work within the image just as within a file. It never shares
 * the offset with a table file: it cannot start while a table file is open
 * for writing, and OpenOutput switches it off. The file framing (header,
 * string table, relocation table) is never written to memory; references
 * written into an image are not resolved.
 *
 * Typical use: StartMemoryOutput(); WriteUInt32(...); ...; StopMemoryOutput();
 * n = MemoryOutputSize(); CopyMemoryOutput(buffer, n); FreeMemoryOutput(). */

/* Releases any earlier image, allocates the first chunk and switches memory
 * output on at offset 0 with no block open. TPLEX_OUT_CANNOT_OPEN while a
 * table file is open for writing; TPLEX_OUT_NO_MEMORY_CHUNK when the chunk
 * cannot be allocated (the earlier image is then kept, memory output off). */
status_code StartMemoryOutput(void);
/* Switches memory output off; the image stays readable. Always 0. */
status_code StopMemoryOutput(void);
/* Number of bytes in the image (0 when there is none). */
uint32_t MemoryOutputSize(void);
/* Copies the first min(size, MemoryOutputSize()) bytes of the image into
 * buffer (which must hold size bytes) and returns that number. */
uint32_t CopyMemoryOutput(uint8_t *buffer, uint32_t size);
/* Switches memory output off and releases the image. Always 0. */
status_code FreeMemoryOutput(void);

/* ------------------------------------------------------------------------ */
/* Checking a table file                                                    */
/* ------------------------------------------------------------------------ */

/* The checker reads a table file's bytes, raw or hex text, checks the
 * framing and every relocation entry, and gives its findings as data. It
 * never reads past the bytes it is given; a malformed table is a finding,
 * not a crash. */

/* One relocation entry of a checked table. */
typedef struct table_relocation {
    uint32_t location; /* offset of the placeholder */
    uint32_t target;   /* offset it stands for */
    uint8_t is_string; /* placeholder 0x4B4B4B4B: the target starts a string */
} table_relocation;

/* What CheckTable found. table points at the table's bytes: into the data
 * given when it was raw, into decoded (owned) when it was hex text. */
typedef struct table_check {
    const uint8_t *table;
    uint32_t size;              /* bytes of table */
    uint8_t hex_text;           /* 1 when the file was hex text */
    uint8_t *decoded;           /* the decoded bytes of hex text, or null */
    uint32_t tag;               /* header word at 0 */
    uint32_t length;            /* header word at 4 */
    uint32_t relocation_offset; /* R, header word at 8 */
    uint32_t header_word;       /* word at 12, 60 in a sound file */
    uint32_t relocation_count;
    uint32_t string_offset; /* S: first referenced string, or R without strings */
    uint32_t string_count;  /* string references */
    char error[160];        /* why the table is not sound; empty when it is */
} table_check;

/* Checks the bytes of a table file (hex text is detected and decoded).
 * 1 for a sound table; 0 otherwise, with the reason in result->error.
 * Either way the result must be released with ReleaseTableCheck. */
uint8_t CheckTable(const uint8_t *data, size_t size, table_check *result);
/* Releases what CheckTable allocated; the result then holds no table. */
void ReleaseTableCheck(table_check *result);
/* Entry index (below relocation_count) of a checked table. */
table_relocation TableRelocationAt(const table_check *check, uint32_t index);
/* The NUL-terminated string at offset of a sound table (a string target). */
const char *TableStringAt(const table_check *check, uint32_t offset);

#ifdef __cplusplus
}
#endif

#endif /* TPLEX_TABLE_OUTPUT_H */
