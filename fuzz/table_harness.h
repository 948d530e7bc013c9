// The table output harnesses.
//
// run_table_output: the input is a script. Its first bytes give the flags,
// the tag and how the output ends; each following byte picks an operation
// (writers, alignment, blocks, references, strings, memory output, an
// allocation failure, and rarer calls) with its arguments after it. At the
// end comes CloseOutput or AbandonOutput; a file that CloseOutput reports
// complete must be accepted by the table checker, and a file abandoned must
// be gone. The tables are then freed and every descriptor closed again.
//
// run_table_check: the input is the bytes of a table file, raw or hex text,
// given to the table checker; what it accepts must be safe to walk.
#ifndef TPLEX_FUZZ_TABLE_HARNESS_H
#define TPLEX_FUZZ_TABLE_HARNESS_H

#include <cstddef>
#include <cstdint>

namespace tplex::fuzz {

void run_table_output(const std::uint8_t *data, std::size_t size);
void run_table_check(const std::uint8_t *data, std::size_t size);

}  // namespace tplex::fuzz

#endif
