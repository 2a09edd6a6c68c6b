// varnoth ir and match-channels.
#include "tools/ToolTestSupport.h"

namespace {

class ChannelCommands : public ToolFixture {
protected:
    void SetUp() override {
        ToolFixture::SetUp();
        WriteNoise("colour.png", 40, 36, 24, 1);
        WriteNoise("grey.png", 40, 36, 8, 2);
        WriteNoise("small.png", 20, 36, 8, 3);
        WriteText("text.png", "not a picture");
    }
};

TEST_F(ChannelCommands, IrAndMatchChannelsAnswer) {
    EXPECT_EQ(Geometry(RunForImage("ir colour.png -o out.png")), "40x36x8");
    EXPECT_EQ(Geometry(RunForImage("ir --planes grey.png colour.png grey.png -o out.png")), "40x36x8");
    EXPECT_EQ(Run("match-channels colour.png"), 0) << errors;
    // A flat picture has no strokes.
    CImage flat(40, 36, 24);
    flat.Set(200);
    ASSERT_TRUE(flat.ExportFile(Path("flat.png")));
    ASSERT_EQ(Run("match-channels flat.png --json"), 0) << errors;
    EXPECT_EQ(output, "{\"segments\": []}\n");
}

TEST_F(ChannelCommands, BadInputIsRefusedWithoutOutput) {
    ExpectRefused("ir missing.png -o out.png", "missing.png");
    ExpectRefused("ir --planes grey.png grey.png small.png -o out.png", "small.png");
    ExpectRefused("ir -o out.png", "--planes");
    ExpectRefused("ir colour.png -o out.txt", "out.txt", "out.txt");
    ExpectRefused("match-channels text.png", "text.png");
    ExpectRefused("match-channels --planes small.png grey.png grey.png", "grey.png");
}

}  // namespace
