// varnoth fuse and stitch.
#include "tools/ToolTestSupport.h"

namespace {

class PyramidCommands : public ToolFixture {
protected:
    void SetUp() override {
        ToolFixture::SetUp();
        WriteNoise("a.png", 40, 36, 24, 1);
        WriteNoise("b.png", 40, 36, 24, 2);
        WriteNoise("grey.png", 40, 36, 8, 3);
        WriteNoise("small.png", 20, 36, 24, 4);
        WriteText("text.png", "not a picture");
    }
};

TEST_F(PyramidCommands, FuseAndStitchWriteTheirImages) {
    EXPECT_EQ(Geometry(RunForImage("fuse a.png b.png --levels 3 -o out.png")), "40x36x24");
    EXPECT_EQ(Geometry(RunForImage("fuse grey.png grey.png --levels 2 --map grey.png -o out.png")), "40x36x8");
    // Four images side by side, twice as wide.
    EXPECT_EQ(Geometry(RunForImage("stitch a.png b.png b.png a.png --offsets 20,150,20,150,20,150,20,150 "
                                   "--levels 3 -o out.png")),
              "80x36x24");
}

TEST_F(PyramidCommands, BadInputIsRefusedWithoutOutput) {
    ExpectRefused("fuse a.png missing.png --levels 3 -o out.png", "missing.png");
    ExpectRefused("fuse a.png text.png --levels 3 -o out.png", "text.png");
    ExpectRefused("fuse a.png small.png --levels 3 -o out.png", "small.png");
    ExpectRefused("fuse a.png grey.png --levels 3 -o out.png", "grey.png");
    ExpectRefused("fuse a.png b.png --levels 3 --map a.png -o out.png", "a.png: expected a 8-bit image");
    ExpectRefused("fuse a.png b.png --levels 31 -o out.png", "--levels");
    ExpectRefused("fuse a.png b.png -o out.png", "too small for 6 levels");  // 40 x 36 needs more than 64
    ExpectRefused("stitch a.png b.png a.png small.png --offsets 0,0,0,0,0,0,0,0 --levels 3 -o out.png", "small.png");
    ExpectRefused("stitch a.png b.png a.png b.png --offsets 1,2 --levels 3 -o out.png", "--offsets");
    ExpectRefused("stitch a.png b.png a.png b.png --offsets nan,0,0,0,0,0,1e300,0 --levels 3 -o out.png",
                  "--offsets");
}

}  // namespace
