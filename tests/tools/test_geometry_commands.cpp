// varnoth warp affine, warp radial, seam and hills.
#include "tools/ToolTestSupport.h"

namespace {

class GeometryCommands : public ToolFixture {
protected:
    void SetUp() override {
        ToolFixture::SetUp();
        WriteNoise("colour.png", 40, 36, 24, 1);
        WriteNoise("grey.png", 40, 36, 8, 2);
        WriteText("text.png", "not a picture");
    }
};

TEST_F(GeometryCommands, WarpsKeepTheDepthAndGiveTheAskedSize) {
    EXPECT_EQ(Geometry(RunForImage("warp affine colour.png --matrix 1,0,0,0,1,0 -o out.png")), "40x36x24");
    EXPECT_EQ(Geometry(RunForImage("warp affine grey.png --matrix 0.9,0.1,1,-0.1,0.9,2 --shift 0.5,-2 -o out.png")),
              "40x36x8");
    // Reading every other pixel doubles the image; the corners land at twice their place.
    EXPECT_EQ(Geometry(RunForImage("warp affine colour.png --matrix 0.5,0,0,0,0.5,0 --fit -o out.png")), "79x71x24");
    EXPECT_NE(output.find("output 79 x 71"), std::string::npos) << output;
    EXPECT_NE(output.find("bottom-right -> 78,70"), std::string::npos) << output;

    EXPECT_EQ(Geometry(RunForImage("warp radial colour.png --k 0.1,0,0 -o out.png")), "40x36x24");
    EXPECT_EQ(Geometry(RunForImage("warp radial grey.png --k 0.1,0.01,0 --centre 0.1,-0.1 --scale 30x20 -o out.png")),
              "30x20x8");
}

TEST_F(GeometryCommands, SeamTurnsAQuarterAndHillsGivesGrey) {
    EXPECT_EQ(Geometry(RunForImage("seam colour.png --curve 0.001,0.01,18 --columns 0:39 -o out.png")), "36x40x24");
    EXPECT_EQ(Geometry(RunForImage("seam grey.png --curve 0,0.02,18 --columns 5:30 --angle 3 -o out.png")),
              "36x40x8");
    const CImage hills = RunForImage("hills colour.png --threshold 20 -o out.png");
    ASSERT_EQ(Geometry(hills), "40x36x8");
    for (int y = 2; y < 34; ++y)  // two rows at the top and bottom keep their values
        for (int x = 0; x < 40; ++x) {
            const int v = hills.GetPtrXY(x, y)[0];
            ASSERT_TRUE(v == 0 || v == 100 || v == 200) << x << "," << y << ": " << v;
        }
}

TEST_F(GeometryCommands, BadInputIsRefusedWithoutOutput) {
    ExpectRefused("warp affine missing.png --matrix 1,0,0,0,1,0 -o out.png", "missing.png");
    ExpectRefused("warp affine colour.png --matrix 1,2 -o out.png", "--matrix");
    ExpectRefused("warp affine colour.png --matrix 0,0,0,0,0,0 --fit -o out.png", "--matrix");  // singular
    // The fitted output would take gigabytes: refused before anything is allocated.
    ExpectRefused("warp affine colour.png --matrix 0.001,0,0,0,0.001,0 --fit -o out.png", "--matrix");
    ExpectRefused("warp affine colour.png --matrix 1,0,0,0,1,0 --shift 1 -o out.png", "--shift");
    ExpectRefused("warp radial text.png --k 0,0,0 -o out.png", "text.png");
    ExpectRefused("warp radial colour.png --k 0,0,0 --centre 1e39,0 -o out.png", "--centre");
    ExpectRefused("warp radial colour.png --k 0,0,0 --scale 0x5 -o out.png", "--scale");
    ExpectRefused("warp radial colour.png --k 0,0,0 --scale 60000x60000 -o out.png", "--scale");
    ExpectRefused("seam text.png --curve 0,0,1 --columns 0:39 -o out.png", "text.png");
    ExpectRefused("seam grey.png --curve 0,0,1 --columns 39:0 -o out.png", "--columns");
    ExpectRefused("hills missing.png --threshold 20 -o out.png", "missing.png");
    ExpectRefused("hills grey.png --threshold 20 -o text.png/out.png", "text.png/out.png");  // cannot be written
}

}  // namespace
