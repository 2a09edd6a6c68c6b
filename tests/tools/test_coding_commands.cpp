// varnoth correlate and huffman.
#include "tools/ToolTestSupport.h"

namespace {

class CodingCommands : public ToolFixture {
protected:
    void SetUp() override {
        ToolFixture::SetUp();
        WriteNoise("grey.png", 40, 36, 8, 1);
        WriteNoise("colour.png", 40, 36, 24, 2);
        WriteText("text.png", "not a picture");
    }
};

TEST_F(CodingCommands, CorrelateFindsAnImageInItself) {
    ASSERT_EQ(Run("correlate grey.png grey.png --point 20,18 --radius 2 --window 3"), 0) << errors;
    EXPECT_NE(output.find("best offset: (0,0) from the centre, displacement (0,0)"), std::string::npos) << output;
    // The search area partly beyond B: what was computed is said.
    ASSERT_EQ(Run("correlate colour.png grey.png --point 5,18 --shift -2,0 --radius 4 --window 3"), 0) << errors;
    EXPECT_NE(output.find("search area clipped by B: 72 of 81 entries computed"), std::string::npos) << output;
}

TEST_F(CodingCommands, HuffmanPrintsTheCodes) {
    WriteText("hist.txt", "5 5\n10,20\n");
    ASSERT_EQ(Run("huffman --histogram hist.txt"), 0) << errors;
    EXPECT_NE(output.find("       3           20       1  0\n"), std::string::npos) << output;
    EXPECT_NE(output.find("coded size: 70 bits (9 bytes), 1.750 bits per symbol"), std::string::npos) << output;
    // Two byte values, one bit each.
    CImage halves(8, 4, 8);
    for (int y = 0; y < 2; ++y) std::fill_n(halves.GetPtrXY(0, y), 8, 255);
    ASSERT_TRUE(halves.ExportFile(Path("halves.png")));
    ASSERT_EQ(Run("huffman --image halves.png"), 0) << errors;
    EXPECT_NE(output.find("symbols used: 2 of 256, occurrences: 32"), std::string::npos) << output;
    EXPECT_NE(output.find("coded size: 32 bits"), std::string::npos) << output;
}

TEST_F(CodingCommands, BadInputIsRefused) {
    ExpectRefused("correlate grey.png missing.png --point 20,18", "missing.png");
    ExpectRefused("correlate text.png grey.png --point 20,18", "text.png");
    ExpectRefused("correlate grey.png grey.png --point 20.5,18", "--point");
    ExpectRefused("correlate grey.png grey.png --point 20,18 --shift 1", "--shift");
    ExpectRefused("correlate grey.png grey.png --point 2,2 --window 3", "does not fit in grey.png");
    WriteText("letters.txt", "1 2,x");
    ExpectRefused("huffman --histogram letters.txt", "letters.txt: 'x'");
    WriteText("empty.txt", "");
    ExpectRefused("huffman --histogram empty.txt", "empty.txt");
    ExpectRefused("huffman --histogram missing.txt", "missing.txt");
    ExpectRefused("huffman --image text.png", "text.png");
    ExpectRefused("huffman", "--image or --histogram");
    // The tree of a Fibonacci-like histogram is deeper than 31 levels.
    std::string deep;
    for (long long a = 1, b = 1, n = 0; n < 40; ++n) {
        deep += std::to_string(a) + " ";
        b += a;
        a = b - a;
    }
    WriteText("deep.txt", deep);
    ExpectRefused("huffman --histogram deep.txt", "deeper than 31 levels");
}

}  // namespace
