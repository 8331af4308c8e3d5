#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <climits>
#include <cstring>
#include <set>
#include <string>

#include <tessarine/storage.h>

#include "platform/test_hooks.h"
#include "storage/raw_file.h"
#include "test_support.h"

namespace {

using tessarine::testing::FileCall;
namespace st = tessarine::storage;

class RawFile : public tstest::Sandbox {
  protected:
    std::string MakeFile(const std::string &name, size_t bytes) {
        const std::string p = Path(name);
        int32_t fd = -1;
        EXPECT_EQ(FM_Create(p.c_str(), 2, &fd), TS_OK);
        std::string data(bytes, 'x');
        for (size_t i = 0; i < bytes; ++i) data[i] = static_cast<char>('a' + i % 26);
        EXPECT_EQ(FM_Write(fd, data.data(), static_cast<uint32_t>(bytes)), TS_OK);
        EXPECT_EQ(FM_Close(fd), TS_OK);
        return p;
    }
    static off_t SizeOf(const std::string &p) {
        struct stat s{};
        return ::stat(p.c_str(), &s) == 0 ? s.st_size : -1;
    }
};

TEST_F(RawFile, CreateWritesReadsAndDeletes) {
    const std::string p = Path("a");
    int32_t fd = -1;
    ASSERT_EQ(FM_Create(p.c_str(), 2, &fd), TS_OK);
    EXPECT_GT(fd, 0);
    EXPECT_EQ(::fcntl(fd, F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
    EXPECT_EQ(FM_Write(fd, "hello", 5), TS_OK);
    int32_t at = -7;
    EXPECT_EQ(FM_Tell(fd, &at), TS_OK);
    EXPECT_EQ(at, 5);
    char back[5];
    EXPECT_EQ(FM_SeekAndRead(fd, 1, 0, back, 4), TS_OK);
    EXPECT_EQ(std::memcmp(back, "ello", 4), 0);
    EXPECT_EQ(FM_SeekAndWrite(fd, 0, 0, "J", 1), TS_OK);
    EXPECT_EQ(FM_Seek(fd, 0, 0), TS_OK);
    EXPECT_EQ(FM_Read(fd, back, 5), TS_OK);
    EXPECT_EQ(std::memcmp(back, "Jello", 5), 0);
    EXPECT_EQ(FM_Close(fd), TS_OK);
    struct stat s{};
    ASSERT_EQ(::stat(p.c_str(), &s), 0);
    EXPECT_EQ(s.st_mode & 0777, 0600u);
    EXPECT_EQ(FM_Delete(p.c_str()), TS_OK);
    EXPECT_EQ(FM_Delete(p.c_str()), -50);
}

TEST_F(RawFile, CreateOverAnExistingFileKeepsItsLength) {
    const std::string p = MakeFile("hundred", 100);
    int32_t fd = -1;
    ASSERT_EQ(FM_Create(p.c_str(), 2, &fd), TS_OK);
    EXPECT_EQ(SizeOf(p), 100);
    EXPECT_EQ(FM_Write(fd, "zz", 2), TS_OK);
    EXPECT_EQ(SizeOf(p), 100);
    FM_Close(fd);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, OpenNeedsAnExistingFileAndStoresWhatItGot) {
    int32_t fd = 1234;
    EXPECT_EQ(FM_Open(Path("missing").c_str(), 2, &fd), -50);
    EXPECT_EQ(fd, -1);
    const std::string p = MakeFile("f", 10);
    fd = 1234;
    EXPECT_EQ(FM_Open(p.c_str(), 3, &fd), -50) << "access 3 is invalid";
    EXPECT_EQ(fd, -1);
    EXPECT_EQ(FM_Open(p.c_str(), 0, &fd), TS_OK);
    EXPECT_EQ(FM_Write(fd, "a", 1), -50) << "read only";
    FM_Close(fd);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, DescriptorZeroIsAFailureAndStillStored) {
    const std::string p = MakeFile("zero", 3);
    const int saved = ::dup(0);
    ASSERT_GE(saved, 0);
    ::close(0);
    int32_t fd = -5;
    EXPECT_EQ(FM_Open(p.c_str(), 2, &fd), -50);
    EXPECT_EQ(fd, 0);
    EXPECT_EQ(FM_Close(0), TS_OK) << "nothing is called for 0";
    ::close(0);
    fd = -5;
    EXPECT_EQ(FM_Create(p.c_str(), 2, &fd), -50);
    EXPECT_EQ(fd, 0);
    ::close(0);
    ASSERT_EQ(::dup2(saved, 0), 0);
    ::close(saved);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, ModeIsOneSignedByteWidenedWithItsSign) {
    // 0x80 widens to 0xFFFFFF80: read access with create, truncate, exclusive
    // and append among the high bits, so a missing file is made...
    const std::string p = Path("made");
    int32_t fd = -1;
    EXPECT_EQ(FM_Open(p.c_str(), static_cast<int8_t>(0x80), &fd), TS_OK);
    FM_Close(fd);
    EXPECT_EQ(SizeOf(p), 0);
    // ...and an existing one is refused as exclusive.
    EXPECT_EQ(FM_Open(p.c_str(), static_cast<int8_t>(0x80), &fd), -50);
    EXPECT_EQ(FM_Create(p.c_str(), static_cast<int8_t>(0x82), &fd), -50);
    ::chmod(p.c_str(), 0600);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, ReadOfZeroBytesSucceeds) {
    const std::string p = MakeFile("z", 4);
    int32_t fd = -1;
    ASSERT_EQ(FM_Open(p.c_str(), 2, &fd), TS_OK);
    char c;
    EXPECT_EQ(FM_Read(fd, &c, 0), TS_OK);
    ASSERT_EQ(FM_Seek(fd, 2, 0), TS_OK);
    EXPECT_EQ(FM_Read(fd, &c, 0), TS_OK) << "at the end too";
    FM_Close(fd);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, ShortReadIsAFailureThatRecordsErrno) {
    const std::string p = MakeFile("short", 10);
    int32_t fd = -1;
    ASSERT_EQ(FM_Open(p.c_str(), 2, &fd), TS_OK);
    char buf[20];
    FM_LastErrno = -1;
    errno = 1234;
    EXPECT_EQ(FM_SeekAndRead(fd, 50, 0, buf, 4), -50) << "past the end";
    EXPECT_EQ(FM_LastErrno, 1234) << "errno as the runtime left it";
    EXPECT_EQ(FM_SeekAndRead(fd, 0, 0, buf, 20), -50);
    FM_Close(fd);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, SeekTakesOriginBeforeOffsetAndMayPassTheEnd) {
    const std::string p = MakeFile("s", 10);
    int32_t fd = -1;
    ASSERT_EQ(FM_Open(p.c_str(), 2, &fd), TS_OK);
    int32_t at = 0;
    EXPECT_EQ(FM_Seek(fd, 2, -3), TS_OK);
    EXPECT_EQ(FM_Tell(fd, &at), TS_OK);
    EXPECT_EQ(at, 7);
    EXPECT_EQ(FM_Seek(fd, 1, 100), TS_OK);
    EXPECT_EQ(FM_Tell(fd, &at), TS_OK);
    EXPECT_EQ(at, 107);
    EXPECT_EQ(FM_SeekAndWrite(fd, 3, 2, "!", 1), TS_OK) << "offset before origin here";
    EXPECT_EQ(SizeOf(p), 14);
    FM_LastErrno = 0;
    EXPECT_EQ(FM_Seek(fd, 0, -1), -50);
    EXPECT_EQ(FM_LastErrno, EINVAL);
    EXPECT_EQ(FM_Seek(fd, 7, 0), -50) << "no such origin";
    // A seek that would pass a 32-bit offset is refused and does not move.
    ASSERT_EQ(FM_Seek(fd, 0, 5), TS_OK);
    EXPECT_EQ(FM_Seek(fd, 2, INT32_MAX), -50);
    EXPECT_EQ(FM_LastErrno, EOVERFLOW);
    EXPECT_EQ(FM_Tell(fd, &at), TS_OK);
    EXPECT_EQ(at, 5);
    FM_Close(fd);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, ShortWriteIsMinus50AndLeavesTheDescriptorOpen) {
    int32_t fd = -1;
    ASSERT_EQ(FM_Open("/dev/full", 2, &fd), TS_OK);
    FM_LastErrno = 0;
    EXPECT_EQ(FM_Write(fd, "abc", 3), -50) << "a full disk is no status of its own here";
    EXPECT_EQ(FM_LastErrno, ENOSPC);
    EXPECT_EQ(FM_SeekAndWrite(fd, 0, 0, "abc", 3), -50);
    EXPECT_EQ(::fcntl(fd, F_GETFD), FD_CLOEXEC) << "nothing here closes a file on failure";
    EXPECT_EQ(FM_Close(fd), TS_OK);
}

TEST_F(RawFile, CloseOfZeroOrBelowSucceedsSilently) {
    FM_LastErrno = 77;
    EXPECT_EQ(FM_Close(0), TS_OK);
    EXPECT_EQ(FM_Close(-1), TS_OK);
    EXPECT_EQ(FM_Close(987654), -50);
    EXPECT_EQ(FM_Delete(Path("none").c_str()), -50);
    int32_t fd;
    EXPECT_EQ(FM_Open(Path("none").c_str(), 2, &fd), -50);
    EXPECT_EQ(FM_Create((Path("no-dir") + "/x").c_str(), 2, &fd), -50);
    EXPECT_EQ(FM_LastErrno, 77) << "open, create, delete and close leave it alone";
}

TEST_F(RawFile, TellStoresWhatItGot) {
    int32_t at = 5;
    EXPECT_EQ(FM_Tell(987654, &at), -50);
    EXPECT_EQ(at, -1);
    EXPECT_EQ(FM_LastErrno, EBADF);
}

TEST_F(RawFile, InjectedFailuresAreMinus50WithErrno) {
    const std::string p = MakeFile("inj", 64);
    int32_t fd = -1;
    ASSERT_EQ(FM_Open(p.c_str(), 2, &fd), TS_OK);
    char buf[8] = {};
    int32_t at = 0;
    struct Case {
        FileCall kind;
        int32_t (*call)(int32_t, char *, int32_t *);
    };
    const Case cases[] = {
        {FileCall::Read, [](int32_t f, char *b, int32_t *) { return FM_Read(f, b, 4); }},
        {FileCall::Write, [](int32_t f, char *b, int32_t *) { return FM_Write(f, b, 4); }},
        {FileCall::Seek, [](int32_t f, char *, int32_t *) { return FM_Seek(f, 0, 3); }},
        {FileCall::Seek, [](int32_t f, char *, int32_t *a) { return FM_Tell(f, a); }},
        {FileCall::Seek, [](int32_t f, char *b, int32_t *) { return FM_SeekAndRead(f, 3, 0, b, 4); }},
        {FileCall::Read, [](int32_t f, char *b, int32_t *) { return FM_SeekAndRead(f, 3, 0, b, 4); }},
        {FileCall::Seek, [](int32_t f, char *b, int32_t *) { return FM_SeekAndWrite(f, 3, 0, b, 4); }},
        {FileCall::Write, [](int32_t f, char *b, int32_t *) { return FM_SeekAndWrite(f, 3, 0, b, 4); }},
    };
    for (const Case &c : cases) {
        const int64_t calls = tstest::ForEachFileFailure(c.kind, [&](int64_t) {
            FM_LastErrno = 0;
            const int32_t s = c.call(fd, buf, &at);
            if (tessarine::testing::FileFailureHit(c.kind)) {
                EXPECT_EQ(s, -50);
                EXPECT_EQ(FM_LastErrno, EIO);
            } else {
                EXPECT_EQ(s, TS_OK);
            }
        });
        EXPECT_EQ(calls, 1);
    }
    // A failed seek skips the read.
    tessarine::testing::FailFileCallAt(FileCall::Seek, 1);
    EXPECT_EQ(FM_SeekAndRead(fd, 3, 0, buf, 4), -50);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Read), 0);
    tessarine::testing::ResetInjection();
    FM_Close(fd);
    FM_Delete(p.c_str());
}

TEST_F(RawFile, RowRunsMoveInOneCall) {
    const std::string p = Path("rows");
    int32_t fd = -1;
    ASSERT_EQ(FM_Create(p.c_str(), 2, &fd), TS_OK);
    uint8_t rows[3][8];
    for (int r = 0; r < 3; ++r)
        for (int i = 0; i < 8; ++i) rows[r][i] = static_cast<uint8_t>(r * 16 + i);
    tessarine::testing::ResetInjection();
    ASSERT_EQ(st::FM_SeekAndWriteRows(fd, 2, &rows[0][0], 8, 5, 3), TS_OK);
    EXPECT_EQ(tessarine::testing::FileCallCount(FileCall::Write), 1);
    uint8_t flat[15];
    ASSERT_EQ(FM_SeekAndRead(fd, 2, 0, flat, 15), TS_OK);
    for (int r = 0; r < 3; ++r) EXPECT_EQ(std::memcmp(flat + 5 * r, rows[r], 5), 0);
    uint8_t back[3][6] = {};
    ASSERT_EQ(st::FM_SeekAndReadRows(fd, 2, &back[0][0], 6, 5, 3), TS_OK);
    for (int r = 0; r < 3; ++r) EXPECT_EQ(std::memcmp(back[r], rows[r], 5), 0);
    EXPECT_EQ(st::FM_SeekAndReadRows(fd, 10, &back[0][0], 6, 5, 3), -50) << "short";
    tessarine::testing::FailFileCallAt(FileCall::Read, 1);
    EXPECT_EQ(st::FM_SeekAndReadRows(fd, 2, &back[0][0], 6, 5, 3), -50);
    tessarine::testing::FailFileCallAt(FileCall::Write, 1);
    EXPECT_EQ(st::FM_SeekAndWriteRows(fd, 2, &rows[0][0], 8, 5, 3), -50);
    tessarine::testing::FailFileCallAt(FileCall::Seek, 1);
    EXPECT_EQ(st::FM_SeekAndWriteRows(fd, 2, &rows[0][0], 8, 5, 3), -50);
    tessarine::testing::ResetInjection();
    FM_Close(fd);
    FM_Delete(p.c_str());
}

// ---- Scratch files ----------------------------------------------------------------

TEST_F(RawFile, ScratchFileIsPrivateAndNamedInTmpdir) {
    std::set<std::string> names;
    for (int i = 0; i < 20; ++i) {
        char path[513];
        int32_t fd = -1;
        ASSERT_EQ(st::FM_CreateScratchFile(path, &fd), TS_OK);
        EXPECT_GT(fd, 0);
        const std::string name = path;
        EXPECT_EQ(name.rfind(Dir() + "/KLOD", 0), 0u) << name;
        names.insert(name);
        struct stat s{};
        ASSERT_EQ(::fstat(fd, &s), 0);
        EXPECT_EQ(s.st_mode & 0777, 0600u);
        EXPECT_EQ(s.st_size, 0);
        EXPECT_EQ(::fcntl(fd, F_GETFL) & O_ACCMODE, O_RDWR);
        EXPECT_EQ(::fcntl(fd, F_GETFD) & FD_CLOEXEC, FD_CLOEXEC);
        FM_Close(fd);
        EXPECT_EQ(SizeOf(name), 0) << "kept on disk after close";
        FM_Delete(path);
    }
    EXPECT_EQ(names.size(), 20u);
}

TEST_F(RawFile, ScratchDirectoryFallsBackToTmp) {
    const char *const values[] = {"", "/nonexistent/dir", nullptr};
    for (const char *value : values) {
        std::string file = Path("plain-file");
        if (value && *value == '\0') {
            MakeFile("plain-file", 1);  // TMPDIR naming a file is not a directory
            setenv("TMPDIR", file.c_str(), 1);
        } else if (value) {
            setenv("TMPDIR", value, 1);
        } else {
            unsetenv("TMPDIR");
        }
        char path[513];
        int32_t fd = -1;
        ASSERT_EQ(st::FM_CreateScratchFile(path, &fd), TS_OK);
        EXPECT_EQ(std::string(path).rfind("/tmp/KLOD", 0), 0u) << path;
        FM_Close(fd);
        FM_Delete(path);
        setenv("TMPDIR", Dir().c_str(), 1);
        ::unlink(file.c_str());
    }
}

TEST_F(RawFile, ScratchPathLongerThanTheFieldIsRefused) {
    std::string deep = Dir();
    std::vector<std::string> made;
    while (deep.size() < 520) {
        deep += "/" + std::string(100, 'q');
        ASSERT_EQ(::mkdir(deep.c_str(), 0700), 0);
        made.push_back(deep);
    }
    setenv("TMPDIR", deep.c_str(), 1);
    char path[513] = "untouched";
    int32_t fd = -7;
    EXPECT_EQ(st::FM_CreateScratchFile(path, &fd), -50);
    EXPECT_STREQ(path, "untouched");
    EXPECT_EQ(fd, -7);
    setenv("TMPDIR", Dir().c_str(), 1);
    for (auto it = made.rbegin(); it != made.rend(); ++it) ::rmdir(it->c_str());
}

TEST_F(RawFile, ScratchFileThatCannotBeOpenedLeavesNoPath) {
    // A directory where nothing can be made, not even by root.
    setenv("TMPDIR", "/proc", 1);
    char path[513] = "untouched";
    int32_t fd = 7;
    EXPECT_EQ(st::FM_CreateScratchFile(path, &fd), -50);
    EXPECT_EQ(fd, -1) << "the runtime's result is stored";
    EXPECT_EQ(path[0], '\0') << "the name is not ours to delete";
    char tilePath[513] = "";
    fd = -1;
    EXPECT_EQ(HVT_CreateBlankTileBmpFile(2, 8, 4, 4, 1, 1, 0, 0, nullptr, tilePath, &fd, 1, 0, 0),
              -1);
    EXPECT_EQ(tilePath[0], '\0');
    setenv("TMPDIR", Dir().c_str(), 1);
}

TEST_F(RawFile, ScratchNameAllocationFailureIsMinus50) {
    tstest::ForEachAllocationFailure([&](int64_t) {
        char path[513];
        int32_t fd = -1;
        const int32_t s = st::FM_CreateScratchFile(path, &fd);
        if (tessarine::testing::AllocationFailureHit()) {
            EXPECT_EQ(s, -50);
            EXPECT_EQ(fd, -1);
        } else {
            EXPECT_EQ(s, TS_OK);
            FM_Close(fd);
            FM_Delete(path);
        }
    });
}

TEST_F(RawFile, CopyPathCopiesTheTerminator) {
    char out[8];
    std::memset(out, 'x', sizeof out);
    st::FM_CopyPath("abc", out);
    EXPECT_STREQ(out, "abc");
    EXPECT_EQ(out[4], 'x');
}

}  // namespace
