// varnoth holo4, holo2, edges and demo.
#include "tools/ToolTestSupport.h"

namespace {

class HologramCommands : public ToolFixture {
protected:
    void SetUp() override {
        ToolFixture::SetUp();
        for (int k = 0; k < 4; ++k) WriteNoise("shot" + std::to_string(k) + ".png", 66, 65, 24, k + 1);
        WriteNoise("a.png", 40, 36, 24, 5);
        WriteNoise("b.png", 40, 36, 24, 6);
        WriteNoise("grey.png", 40, 36, 8, 7);
        WriteNoise("tiny.png", 15, 36, 24, 8);
        WriteText("text.png", "not a picture");
    }
};

// Every method runs in the demo below; here the choice by name and the rows.
TEST_F(HologramCommands, CompositesHaveTheShotsSize) {
    EXPECT_EQ(Geometry(RunForImage("holo4 shot0.png shot1.png shot2.png shot3.png -o out.png")), "66x65x24");
    EXPECT_EQ(Geometry(RunForImage("holo4 shot0.png shot1.png shot2.png shot3.png --method steps -o out.png")),
              "66x65x24");
    EXPECT_EQ(Geometry(RunForImage("holo2 a.png b.png -o out.png")), "40x36x24");
    EXPECT_EQ(Geometry(RunForImage("holo2 a.png b.png --rows 2:30 --method votes -o out.png")), "40x36x24");
    // Grey shots are widened to colour.
    EXPECT_EQ(Geometry(RunForImage("edges grey.png b.png --direction v -o out.png")), "40x36x24");
    ASSERT_EQ(Run("edges a.png b.png --threshold 5 -o out.png --second second.png"), 0) << errors;
    EXPECT_TRUE(std::filesystem::exists(Path("out.png")));
    EXPECT_TRUE(std::filesystem::exists(Path("second.png")));
}

TEST_F(HologramCommands, BadInputIsRefusedWithoutOutput) {
    ExpectRefused("holo4 shot0.png shot1.png missing.png shot3.png -o out.png", "missing.png");
    ExpectRefused("holo4 shot0.png shot1.png shot2.png a.png -o out.png", "a.png");
    ExpectRefused("holo4 a.png a.png a.png a.png -o out.png", "too small");
    ExpectRefused("holo4 shot0.png shot1.png shot2.png shot3.png --method best -o out.png", "--method");
    ExpectRefused("holo2 text.png b.png -o out.png", "text.png");
    ExpectRefused("holo2 a.png shot0.png -o out.png", "shot0.png");
    ExpectRefused("holo2 tiny.png tiny.png -o out.png", "16 x 16");
    ExpectRefused("holo2 a.png b.png --rows 5:200 -o out.png", "--rows");
    ExpectRefused("holo2 a.png b.png --rows 5 -o out.png", "--rows");
    ExpectRefused("edges a.png missing.png -o out.png", "missing.png");
    ExpectRefused("edges a.png b.png --direction x -o out.png", "--direction");
    ExpectRefused("edges a.png b.png --border 5 -o out.png", "--border");
    ExpectRefused("edges a.png b.png --border 18 -o out.png", "--border");
}

TEST_F(HologramCommands, DemoWritesItsPicturesAndRefusesABadSize) {
    ASSERT_EQ(Run("demo --size 96x128 --out pictures"), 0) << errors;
    for (const char* name : {"shot_top.png", "truth.png", "result_pyramid.png", "montage.png", "montage_two.png"})
        EXPECT_TRUE(std::filesystem::exists(dir / "pictures" / name)) << name;
    CImage truth;
    ASSERT_TRUE(truth.ImportFile(Path("pictures/truth.png")));
    EXPECT_EQ(Geometry(truth), "96x128x24");
    ExpectRefused("demo --size 96 --out refused", "--size", "refused");
    ExpectRefused("demo --size 64x128 --out refused", "--size", "refused");
}

// A second output that cannot be written takes the first with it; values that would wrap when
// doubled are refused; a demo directory that is a file is bad input.
TEST_F(HologramCommands, OutOfRangeValuesAndUnwritableOutputs) {
    ExpectRefused("edges a.png b.png -o out.png --second text.png/second.png", "text.png/second.png");
    ExpectRefused("edges a.png b.png --border 1500000000 -o out.png", "--border");
    ExpectRefused("edges a.png b.png --threshold 2000000000 -o out.png", "--threshold");
    ExpectRefused("demo --size 96x128 --out text.png", "text.png", "text.png/truth.png");
}

}  // namespace
