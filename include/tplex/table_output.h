/*
 * tplex table output: writes a compiler's generated tables as one table
 * file with forward references, a string table and a relocation table.
 *
 * These operations live in the static archive (libtplex.a) with C linkage;
 * the shared library does not export them. One output at a time per process.
 * Every operation returns 0 or a negative status code (TPLEX_OUT_* in
 * tplex/lexer.h).
 */
#ifndef TPLEX_TABLE_OUTPUT_H
#define TPLEX_TABLE_OUTPUT_H

#include "tplex/lexer.h"

#ifdef __cplusplus
extern "C" {
#endif

/* Flags of OpenOutput(). */
#define TPLEX_OUT_ALIGN 0x01u          /* align 16-bit values to 2, 32-bit values to 4 */
#define TPLEX_OUT_HEX_TEXT 0x02u       /* write the file as hexadecimal text */
#define TPLEX_OUT_DROP_NEWLINES 0x04u  /* StoreString drops the backslash-n escape */
#define TPLEX_OUT_DIAGNOSTICS 0x08u    /* print failure messages on standard error */
#define TPLEX_OUT_LITERAL_BACKSLASH 0x10u /* StoreString keeps backslashes as they are */

status_code OpenOutput(const char *name, uint32_t flags, uint32_t tag);
status_code WriteInt8(int8_t v);
status_code WriteUInt8(uint8_t v);
status_code WriteInt16(int16_t v);
status_code WriteUInt16(uint16_t v);
status_code WriteInt32(int32_t v);
status_code WriteUInt32(uint32_t v);
status_code PutByte(uint8_t b);
status_code AlignOutput(uint32_t boundary);
status_code BeginBlock(void);
status_code EndBlock(void);
status_code AllocateReference(uint32_t *out_id);
status_code CreateReference(uint32_t id, uint32_t offset);
status_code SetReferenceTarget(uint32_t id, uint32_t target, uint32_t string_flag);
status_code DefineReference(uint32_t id, uint32_t offset);
status_code DefineReferenceHere(uint32_t *out_id, uint32_t id, uint32_t align);
status_code WriteReference(uint32_t *out_id, uint32_t id);
status_code StoreString(const char *text);
status_code AddToStringStore(uint32_t *out_position, const char *text);
status_code CloseOutput(void);
status_code AbandonOutput(uint32_t free_tables);
status_code FreeOutputTables(void);

#ifdef __cplusplus
}
#endif

#endif /* TPLEX_TABLE_OUTPUT_H */
