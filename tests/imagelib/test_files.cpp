#include <gtest/gtest.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>

#include "common/TestImages.h"
#include "imagelib/CImage.h"
#include "imagelib/DumpPath.h"

namespace fs = std::filesystem;
using testing_images::RandomImage;
using testing_images::SamePixels;

namespace {

class FileTest : public ::testing::Test {
protected:
    void SetUp() override {
        dir = fs::temp_directory_path() / ("varnoth-files-" + std::to_string(::getpid()));
        fs::create_directories(dir);
    }
    void TearDown() override {
        unsetenv("VARNOTH_DUMP_DIR");
        fs::remove_all(dir);
    }
    std::string Path(const std::string& name) const { return (dir / name).string(); }
    fs::path dir;
};

CImage RoundTrip(const CImage& img, const std::string& path) {
    EXPECT_TRUE(img.ExportFile(path)) << path;
    CImage back;
    std::string error;
    EXPECT_TRUE(back.ImportFile(path, &error)) << path << ": " << error;
    return back;
}

}  // namespace

TEST_F(FileTest, LosslessFormatsRoundTripOddWidths) {
    for (const char* ext : {".bmp", ".png", ".tif"})
        for (int bits : {8, 24}) {
            const CImage img = RandomImage(13, 7, bits, 3);
            EXPECT_TRUE(SamePixels(RoundTrip(img, Path(std::string("a") + std::to_string(bits) + ext)), img))
                << ext << " " << bits;
        }
}

TEST_F(FileTest, JpegRoundTripIsClose) {
    CImage img(32, 16, 24);
    img.Set(120);
    const CImage back = RoundTrip(img, Path("a.jpg"));
    ASSERT_EQ(back.GetBitCount(), 24);
    EXPECT_NEAR(back.GetPtrXY(5, 5)[1], 120, 3);
}

TEST_F(FileTest, BmpCarriesThePalette) {
    CImage grey(4, 2, 8);
    grey.GetPtrXY(1, 0)[0] = 254;
    EXPECT_EQ(RoundTrip(grey, Path("grey.bmp")).GetBitCount(), 8);  // the default ramp reads back as grey
    grey.SetPaletteColor(254, RGB(255, 0, 0));
    const CImage colour = RoundTrip(grey, Path("pal.bmp"));
    ASSERT_EQ(colour.GetBitCount(), 24);
    const unsigned char* red = colour.GetPtrXY(1, 0);
    EXPECT_EQ(red[0], 0);
    EXPECT_EQ(red[2], 255);
}

TEST_F(FileTest, ImportRefusesWhatItCannotRead) {
    CImage img(3, 3, 8);
    std::string error;
    EXPECT_FALSE(img.ImportFile(Path("missing.png"), &error));
    EXPECT_FALSE(error.empty());
    std::ofstream(Path("text.png")) << "not an image";
    EXPECT_FALSE(img.ImportFile(Path("text.png"), &error));
    EXPECT_EQ(img.GetWidth(), 3);  // unchanged on failure
    EXPECT_FALSE(img.ExportFile(Path("a.gif")));
    EXPECT_FALSE(fs::exists(Path("a.gif")));
    EXPECT_FALSE(img.ExportFile(Path("no-such-folder/a.png")));  // plain paths get no folders made

    // Files cut short are refused, whatever the format.
    const CImage noise = RandomImage(40, 30, 24, 9);
    for (const char* name : {"cut.png", "cut.jpg", "cut.bmp", "cut.tif"}) {
        ASSERT_TRUE(noise.ExportFile(Path(name)));
        fs::resize_file(Path(name), fs::file_size(Path(name)) / 2);
        EXPECT_FALSE(img.ImportFile(Path(name), &error)) << name;
    }

    // A header claiming 60000 x 60000 pixels is refused before anything is allocated.
    ASSERT_TRUE(img.ExportFile(Path("huge.bmp")));
    {
        std::fstream f(Path("huge.bmp"), std::ios::in | std::ios::out | std::ios::binary);
        const unsigned char size[4] = {0x60, 0xEA, 0, 0};
        f.seekp(18);
        f.write(reinterpret_cast<const char*>(size), 4);
        f.write(reinterpret_cast<const char*>(size), 4);
    }
    EXPECT_FALSE(img.ImportFile(Path("huge.bmp"), &error));
    EXPECT_NE(error.find("size"), std::string::npos);
}

TEST_F(FileTest, DumpPathsLandUnderTheDumpDirectoryOrNowhere) {
    unsetenv("VARNOTH_DUMP_DIR");
    EXPECT_FALSE(imagelib::DumpsEnabled());
    EXPECT_FALSE(imagelib::ResolveOutputPath(L"\\Results\\brightMap.bmp").has_value());
    EXPECT_EQ(*imagelib::ResolveOutputPath(L"/tmp/x.png"), "/tmp/x.png");

    setenv("VARNOTH_DUMP_DIR", dir.c_str(), 1);
    EXPECT_EQ(*imagelib::ResolveOutputPath(L"\\Results\\brightMap.bmp"), Path("results/brightMap.bmp"));
    EXPECT_EQ(*imagelib::ResolveOutputPath(L"c:\\ZentLogDir\\X.bmp"), Path("zentlogdir/X.bmp"));
    EXPECT_EQ(*imagelib::ResolveOutputPath(L"\\..\\..\\a.bmp"), Path("a.bmp"));

    CImage img(5, 5, 24);
    EXPECT_TRUE(img.ExportFile(L"c:\\ZentLogDir\\fusionLevel0.jpg"));
    EXPECT_TRUE(fs::exists(Path("zentlogdir/fusionLevel0.jpg")));
    unsetenv("VARNOTH_DUMP_DIR");
    EXPECT_FALSE(img.ExportFile(L"\\results\\groups.bmp"));
    EXPECT_FALSE(fs::exists(Path("results")));
}
