// Every bad input: one line on standard error naming the file and what is
// wrong, a non-zero exit code, and no output file left behind (the sandbox
// fails a test that leaves anything in its folder).
#include <csignal>
#include <sys/resource.h>

#include <tessarine/tessarine.h>

#include "cli_test_support.h"

namespace clitest {
namespace {

using tessarine::testing::FileCall;

class BadInput : public CliSandbox {
  protected:
    void ExpectFailure(const RunResult &r, int code, const std::string &names, const std::string &says) {
        EXPECT_EQ(r.code, code) << r.err;
        EXPECT_TRUE(r.out.empty()) << r.out;
        ASSERT_FALSE(r.err.empty());
        EXPECT_EQ(std::count(r.err.begin(), r.err.end(), '\n'), 1) << r.err;
        EXPECT_NE(r.err.find(names), std::string::npos) << r.err;
        EXPECT_NE(r.err.find(says), std::string::npos) << r.err;
    }
    std::string GoodTile(const std::string &name, int w = 300, int h = 40) {
        const std::string png = Made(name + ".png"), tile = Made(name);
        WritePng(png, MakeRgb(w, h));
        EXPECT_EQ(Cli({"import", png, tile}).code, 0);
        return tile;
    }
};

TEST_F(BadInput, MissingFile) {
    ExpectFailure(Cli({"import", Path("nothing.png"), Path("out.tsr")}), 1, "nothing.png", "No such file");
    ExpectFailure(Cli({"info", Path("nothing.tsr")}), 1, "nothing.tsr", "No such file");
    ExpectFailure(Cli({"export", Path("nothing.tsr"), Path("o.png")}), 1, "nothing.tsr", "No such file");
    EXPECT_FALSE(FileExists(Path("out.tsr")));
    EXPECT_FALSE(FileExists(Path("o.png")));
}

TEST_F(BadInput, NotAnImage) {
    const std::string text = Made("notes.png");
    WriteFile(text, "just some words\n");
    ExpectFailure(Cli({"import", text, Path("out.tsr")}), 1, "notes.png", "not a PNG or TIFF");
    const std::string empty = Made("empty.png");
    WriteFile(empty, "");
    ExpectFailure(Cli({"import", empty, Path("out.tsr")}), 1, "empty.png", "empty");
}

TEST_F(BadInput, TruncatedPng) {
    const std::string png = Made("cut.png");
    WritePng(png, MakeRgb(400, 300));
    const std::string bytes = ReadFile(png);
    WriteFile(png, bytes.substr(0, bytes.size() / 2));
    ExpectFailure(Cli({"import", png, Path("out.tsr")}), 1, "cut.png", "PNG");
    EXPECT_FALSE(FileExists(Path("out.tsr")));
    WriteFile(png, bytes.substr(0, 20));
    ExpectFailure(Cli({"import", png, Path("out.tsr")}), 1, "cut.png", "PNG");
}

TEST_F(BadInput, DamagedPngData) {
    const std::string png = Made("bad.png");
    WritePng(png, MakeRgb(200, 100));
    std::string bytes = ReadFile(png);
    for (size_t i = 80; i < bytes.size() - 20; i += 97) bytes[i] = char(bytes[i] ^ 0x55);
    WriteFile(png, bytes);
    ExpectFailure(Cli({"import", png, Path("out.tsr")}), 1, "bad.png", "bad PNG");
}

TEST_F(BadInput, TruncatedTiff) {
    const std::string tif = Made("cut.tif");
    Image im = MakeRgb(500, 400);
    im.colorType = 3;
    im.photometric = 2;
    WriteTiff(tif, im);
    const std::string bytes = ReadFile(tif);
    WriteFile(tif, bytes.substr(0, bytes.size() / 3));
    const RunResult r = Cli({"import", tif, Path("out.tsr")});
    ExpectFailure(r, 1, "cut.tif", "TIFF");
    WriteFile(tif, bytes.substr(0, 6));
    ExpectFailure(Cli({"import", tif, Path("out.tsr")}), 1, "cut.tif", "TIFF");
}

TEST_F(BadInput, UnknownLayoutIsUsage) {
    const std::string png = Made("in.png");
    WritePng(png, MakeRgb(10, 10));
    ExpectFailure(Cli({"import", png, Path("out.tsr"), "--layout", "rgba"}), 2, "rgba", "unknown layout");
    ExpectFailure(Cli({"convert", png, Path("out.tsr"), "--layout", "hsv"}), 2, "hsv", "unknown layout");
}

TEST_F(BadInput, CorruptTileFiles) {
    const std::string good = GoodTile("good.tsr");
    const std::string bytes = ReadFile(good);
    const std::string bad = Made("bad.tsr");
    auto withByte = [&](size_t at, char value) {
        std::string b = bytes;
        b[at] = value;
        WriteFile(bad, b);
    };
    withByte(3, 'X'); // stamp
    ExpectFailure(Cli({"info", bad}), 1, "bad.tsr", "not a tile bitmap file");
    withByte(9, 7); // bits per pixel
    ExpectFailure(Cli({"info", bad}), 1, "bad.tsr", "corrupt");
    withByte(37, 0); // no sub-bitmaps
    ExpectFailure(Cli({"info", bad}), 1, "bad.tsr", "corrupt");
    withByte(37, 12);
    ExpectFailure(Cli({"info", bad}), 1, "bad.tsr", "corrupt");
    withByte(80 + 16 + 1, 9); // first tile's offset
    ExpectFailure(Cli({"export", bad, Path("o.png")}), 1, "bad.tsr", "corrupt");
    withByte(84, 0x7F); // height
    ExpectFailure(Cli({"info", bad}), 1, "bad.tsr", "");
    withByte(36, 3); // indexed without a table
    ExpectFailure(Cli({"info", bad}), 1, "bad.tsr", "corrupt");
    WriteFile(bad, bytes.substr(0, bytes.size() - 100));
    ExpectFailure(Cli({"export", bad, Path("o.png")}), 1, "bad.tsr", "truncated");
    WriteFile(bad, bytes.substr(0, 50));
    ExpectFailure(Cli({"info", bad}), 1, "bad.tsr", "not a tile bitmap file");
    WriteFile(bad, std::string(4000, '\x07'));
    ExpectFailure(Cli({"info", "--json", bad}), 1, "bad.tsr", "");
    EXPECT_FALSE(FileExists(Path("o.png")));
}

TEST_F(BadInput, MissingSubBitmapIsUsage) {
    const std::string tile = GoodTile("t.tsr");
    ExpectFailure(Cli({"export", tile, Path("o.png"), "--sub", "3"}), 2, "t.tsr", "no sub-bitmap 3");
    EXPECT_FALSE(FileExists(Path("o.png")));
}

TEST_F(BadInput, OutputFolderMissingOrNotAFolder) {
    const std::string png = Made("in.png");
    WritePng(png, MakeRgb(10, 10));
    ExpectFailure(Cli({"import", png, Path("no/such/out.tsr")}), 1, "out.tsr", "No such file");
    const std::string tile = GoodTile("t.tsr");
    ExpectFailure(Cli({"export", tile, Path("in.png/o.png")}), 1, "o.png", "not a folder");
    ExpectFailure(Cli({"export", tile, Dir()}), 2, Dir(), ".png");
}

TEST_F(BadInput, OutputNameWithoutImageTypeIsUsage) {
    const std::string tile = GoodTile("t.tsr");
    ExpectFailure(Cli({"export", tile, Path("o.bmp")}), 2, "o.bmp", ".png");
    ExpectFailure(Cli({"export", tile, Path("o.png"), "--tiff-cmyk"}), 2, "--tiff-cmyk", ".tif");
}

// A file size limit stands in for a full disk: writes fail with EFBIG.
class FullDisk {
  public:
    explicit FullDisk(rlim_t bytes) {
        getrlimit(RLIMIT_FSIZE, &saved_);
        old_ = std::signal(SIGXFSZ, SIG_IGN);
        rlimit limit = saved_;
        limit.rlim_cur = bytes;
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FullDisk() {
        setrlimit(RLIMIT_FSIZE, &saved_);
        std::signal(SIGXFSZ, old_);
    }

  private:
    rlimit saved_{};
    void (*old_)(int) = nullptr;
};

TEST_F(BadInput, FullDiskDuringImport) {
    const std::string png = Made("in.png");
    WritePng(png, MakeRgb(3000, 700));
    RunResult r;
    {
        FullDisk full(1 << 20);
        r = Cli({"import", png, Path("out.tsr")});
    }
    ExpectFailure(r, 1, "out.tsr", "");
    EXPECT_FALSE(FileExists(Path("out.tsr")));
}

TEST_F(BadInput, FullDiskDuringExport) {
    const std::string tile = GoodTile("t.tsr", 3000, 700);
    for (const char *name : {"o.png", "o.tif"}) {
        RunResult r;
        {
            FullDisk full(1 << 16);
            r = Cli({"export", tile, Path(name)});
        }
        ExpectFailure(r, 1, name, "cannot write");
        EXPECT_FALSE(FileExists(Path(name)));
    }
}

// A write of the library that fails at any point fails the import cleanly.
TEST_F(BadInput, EveryTileWriteFailure) {
    const std::string png = Made("in.png");
    WritePng(png, MakeRgb(8200, 40));
    const std::string out = Path("out.tsr");
    tstest::ForEachFileFailure(FileCall::Write, [&](int64_t n) {
        const RunResult r = Cli({"import", png, out});
        if (tessarine::testing::FileFailureHit(FileCall::Write)) {
            EXPECT_EQ(r.code, 1) << "write " << n;
            EXPECT_NE(r.err.find("out.tsr"), std::string::npos) << r.err;
            EXPECT_FALSE(FileExists(out)) << "write " << n;
        } else {
            EXPECT_EQ(r.code, 0) << r.err;
            std::remove(out.c_str());
        }
    });
}

TEST_F(BadInput, EveryTileReadFailure) {
    const std::string tile = GoodTile("t.tsr", 8200, 30);
    const std::string out = Path("o.png");
    tstest::ForEachFileFailure(FileCall::Read, [&](int64_t n) {
        const RunResult r = Cli({"export", tile, out});
        if (tessarine::testing::FileFailureHit(FileCall::Read)) {
            EXPECT_EQ(r.code, 1) << "read " << n;
            EXPECT_NE(r.err.find("t.tsr"), std::string::npos) << r.err;
            EXPECT_FALSE(FileExists(out));
        } else {
            EXPECT_EQ(r.code, 0) << r.err;
            std::remove(out.c_str());
        }
    });
}

TEST_F(BadInput, EveryAllocationFailure) {
    const std::string png = Made("in.png");
    WritePng(png, MakeGray(300, 20, 8));
    const std::string out = Path("out.tsr");
    tstest::ForEachAllocationFailure([&](int64_t n) {
        const RunResult r = Cli({"import", png, out, "--layout", "indexed"});
        // Some allocations have a fall-back (a smaller block, pages of the
        // ordinary size); those runs succeed.
        if (tessarine::testing::AllocationFailureHit() && r.code != 0) {
            EXPECT_EQ(r.code, 1) << "allocation " << n;
            EXPECT_NE(r.err.find("memory"), std::string::npos) << r.err;
            EXPECT_FALSE(FileExists(out));
        } else {
            EXPECT_EQ(r.code, 0) << r.err;
            std::remove(out.c_str());
        }
    });
}

}  // namespace
}  // namespace clitest
