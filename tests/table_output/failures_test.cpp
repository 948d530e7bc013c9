// Every failure code with its message and its effect on the table file.
#include <sys/stat.h>

#include <functional>
#include <string>

#include "table_fixture.h"

namespace tplex::test {
namespace {

struct Failure {
    std::function<status_code()> run;  // on an open output
    status_code code;
    std::string message;  // on standard error, with diagnostics on
    bool closes;          // the file takes no further byte
};

class FailureTest : public TableTest {
protected:
    // Runs each case diagnostics on and off; the output is then abandoned,
    // which deletes its file whether or not the failure closed it.
    void expect_failures(const std::vector<Failure> &cases) {
        for (const Failure &f : cases) {
            for (std::uint32_t flags : {TPLEX_OUT_DIAGNOSTICS, 0u}) {
                SCOPED_TRACE(f.message + (flags ? " (diagnostics)" : ""));
                open(flags);
                CaptureStderr err;
                EXPECT_EQ(f.run(), f.code);
                EXPECT_EQ(err.text(), flags != 0 ? f.message : "");
                EXPECT_EQ(PutByte(0) == TPLEX_OUT_WRITE_FAILED, f.closes);
                EXPECT_EQ(AbandonOutput(1), TPLEX_OK);
                EXPECT_FALSE(exists());
            }
        }
    }
};

// Set-up steps before the failing one cannot fail.
status_code allocate_50001() {
    std::uint32_t id = 0;
    for (int i = 0; i < 50000; ++i) AllocateReference(&id);
    status_code s = AllocateReference(&id);
    return id == 0 ? s : TPLEX_OK;
}
status_code define_twice() {
    std::uint32_t id;
    DefineReferenceHere(&id, 0, 0);
    return DefineReference(id, 40);
}
status_code use_beyond_r() {
    std::uint32_t id;
    DefineReferenceHere(&id, 0, 0), CreateReference(id, 9999);
    return CloseOutput();
}
status_code string_beyond_r() {  // S + position - 1 must not wrap below R
    std::uint32_t id;
    AllocateReference(&id), CreateReference(id, 16), WriteUInt32(0);
    SetReferenceTarget(id, 0xFFFFFFF0u, 1);
    return CloseOutput();
}

TEST_F(FailureTest, Codes) {
    const std::string p = "sg_TableOutput: ", out_of_range = p + "relocatable out of range\n";
    expect_failures({
        {allocate_50001, TPLEX_OUT_TOO_MANY_REFERENCES,
         "sg_TableOutput (StoreString): Failed to allocate reference\n", true},
        {[] { return DefineReference(3, 20); }, TPLEX_OUT_BAD_TARGET_ID,
         p + "Illegal cross reference id 3\n", true},
        {define_twice, TPLEX_OUT_DOUBLE_DEFINITION, p + "Double definition of reference 0\n", true},
        {[] { return CreateReference(0, 20); }, TPLEX_OUT_BAD_USE_ID,
         p + "Illegal cross reference id 0\n", true},
        {[] { return StoreString("s"), table_output.store.total += 3, CloseOutput(); },
         TPLEX_OUT_STRING_TABLE_DAMAGED, p + "String table integrity damaged\n", true},
        {[] { return DefineReferenceHere(nullptr, 0, 0), CloseOutput(); },
         TPLEX_OUT_UNUSED_REFERENCE, p + "relocatable with no references 0\n", true},
        {[] { return WriteReference(nullptr, 0), DefineReference(1, 0), CloseOutput(); },
         TPLEX_OUT_UNDEFINED_REFERENCE, p + "relocatable with no definition\n", true},
        {use_beyond_r, TPLEX_OUT_OUT_OF_RANGE, out_of_range, true},
        {string_beyond_r, TPLEX_OUT_OUT_OF_RANGE, out_of_range, true},
        {EndBlock, TPLEX_OUT_NO_OPEN_BLOCK, "", false},
        // Refusals: nothing written, the output goes on.
        {[] { return StoreString(std::string(10000, 'x').c_str()); }, TPLEX_OUT_STRING_TOO_LONG,
         "sg_TableOutput (StoreString): String too long\n", false},
        {[this] {
             return OpenOutput((path + "2").c_str(),
                               output_stream.diagnostics ? TPLEX_OUT_DIAGNOSTICS : 0, 0);
         },
         TPLEX_OUT_CANNOT_OPEN, p + "can't open '" + path + "2'\n", false},
    });
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_NOT_OPEN);
}

TEST_F(FailureTest, OpenFailures) {
    for (const std::string &name : {dir.path() + "/missing/t", std::string(200, 'n')}) {
        CaptureStderr err;
        EXPECT_EQ(OpenOutput(name.c_str(), TPLEX_OUT_DIAGNOSTICS, 0), TPLEX_OUT_CANNOT_OPEN);
        EXPECT_EQ(err.text(), "sg_TableOutput: can't open '" + name + "'\n");
        EXPECT_EQ(AbandonOutput(0), TPLEX_OUT_NOT_OPEN);
    }
    EXPECT_EQ(OpenOutput(nullptr, 0, 0), TPLEX_OUT_CANNOT_OPEN);
    path = dir.path() + "/" + std::string(199 - dir.path().size() - 1, 'n');  // 199 characters
    open();
}

// A failing write closes the file once; later bytes fail quietly; a full
// disk is never reported as success.
TEST_F(FailureTest, WriteFailuresOnAFullDevice) {
#ifdef _WIN32
    GTEST_SKIP() << "no full device to write to on Windows (/dev/full)";
#else
    if (access("/dev/full", W_OK) != 0) GTEST_SKIP() << "no /dev/full";
    for (std::uint32_t flags : {0u, TPLEX_OUT_HEX_TEXT}) {
        ASSERT_EQ(symlink("/dev/full", path.c_str()), 0);
        open(TPLEX_OUT_DIAGNOSTICS | flags);
        CaptureStderr err;
        status_code s = TPLEX_OK;
        for (int i = 0; i < (1 << 20) && s == TPLEX_OK; ++i) s = WriteUInt8(1);
        EXPECT_EQ(s, TPLEX_OUT_WRITE_FAILED);
        EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
        EXPECT_EQ(err.text(), "sg_TableOutput: Fatal erorr: Write byte error\n");
        EXPECT_EQ(AbandonOutput(0), TPLEX_OK);
    }
    ASSERT_EQ(symlink("/dev/full", path.c_str()), 0);
    open();  // a small table: only the final flush can fail
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_WRITE_FAILED);
#endif
}

TEST_F(FailureTest, SeekFailureIsAlwaysPrintedOnStandardOutput) {
#ifdef _WIN32
    GTEST_SKIP() << "no unseekable file to open by name on Windows (a FIFO)";
#else
    ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
    open();  // no diagnostics
    CaptureStdout out;
    EXPECT_EQ(CloseOutput(), TPLEX_OUT_SEEK_FAILED);
    EXPECT_EQ(out.text(), "sg_TableOutput: File seek failed - error = -1\n");
#endif
}

}  // namespace
}  // namespace tplex::test
