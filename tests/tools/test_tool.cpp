// The tool's answers to bad input: one line naming the file, exit code 2, no output file.
#include <filesystem>
#include <fstream>
#include <string>

#include "imagelib/CImage.h"
#include "tools/ToolTestSupport.h"

namespace fs = std::filesystem;

namespace {

class ToolTest : public ToolFixture {
protected:
    void SetUp() override {
        ToolFixture::SetUp();
        CImage a(9, 7, 24), b(9, 7, 24), small(4, 4, 24);
        a.Set(100);
        b.Set(50);
        ASSERT_TRUE(a.ExportFile(Path("a.png")));
        ASSERT_TRUE(b.ExportFile(Path("b.png")));
        ASSERT_TRUE(small.ExportFile(Path("small.png")));
        std::ofstream(Path("text.png")) << "hello";
    }
};

}  // namespace

TEST_F(ToolTest, SubtractWritesItsOutput) {
    EXPECT_EQ(Run("subtract " + Path("a.png") + " " + Path("b.png") + " -o " + Path("d.png")), 0);
    CImage d;
    ASSERT_TRUE(d.ImportFile(Path("d.png")));
    EXPECT_EQ(d.GetPtrXY(8, 6)[0], 178);
}

TEST_F(ToolTest, BadInputGivesOneLineExitTwoAndNoOutput) {
    const std::string out = Path("out.png");
    EXPECT_EQ(Run("add " + Path("missing.png") + " " + Path("b.png") + " -o " + out), 2);
    EXPECT_NE(errors.find("missing.png"), std::string::npos);
    EXPECT_EQ(Run("add " + Path("text.png") + " " + Path("b.png") + " -o " + out), 2);
    EXPECT_NE(errors.find("unsupported file format"), std::string::npos);
    EXPECT_EQ(Run("add " + Path("a.png") + " " + Path("small.png") + " -o " + out), 2);
    EXPECT_NE(errors.find("small.png"), std::string::npos);
    EXPECT_EQ(Run("insert " + Path("a.png") + " " + Path("small.png") + " -o " + out), 2);
    EXPECT_EQ(Run("add " + Path("a.png") + " " + Path("b.png") + " -o " + Path("out.gif")), 2);
    EXPECT_EQ(Run("frobnicate"), 2);
    EXPECT_FALSE(fs::exists(out));
    for (const auto& entry : fs::directory_iterator(dir))
        EXPECT_EQ(entry.path().filename().string().find(".tmp"), std::string::npos) << entry.path();
}
