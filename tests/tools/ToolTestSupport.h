#pragma once
// Runs the varnoth tool against files in a fresh temporary directory and checks its answers.
#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "imagelib/CImage.h"

class ToolFixture : public ::testing::Test {
protected:
    void SetUp() override {
        const auto* test = ::testing::UnitTest::GetInstance()->current_test_info();
        dir = std::filesystem::temp_directory_path() /
              ("varnoth-tool-" + std::to_string(::getpid()) + "-" + test->test_suite_name() + "-" + test->name());
        std::filesystem::remove_all(dir);
        std::filesystem::create_directories(dir);
    }

    // No command may leave its temporary file behind, whether it succeeded or not.
    void TearDown() override {
        for (const auto& entry : std::filesystem::recursive_directory_iterator(dir))
            EXPECT_EQ(entry.path().filename().string().find(".tmp"), std::string::npos) << entry.path();
        std::filesystem::remove_all(dir);
    }

    std::string Path(const std::string& name) const { return (dir / name).string(); }

    // Runs the tool with `args` (file names given relative to the temporary directory are
    // used as they stand: the tool runs there); returns its exit code, standard output in
    // `output` and standard error in `errors`.
    int Run(const std::string& args) {
        const std::string cmd = "cd '" + dir.string() + "' && " + VARNOTH_TOOL_PATH + " " + args +
                                " >.stdout 2>.stderr";
        const int status = std::system(cmd.c_str());
        output = ReadText(".stdout");
        errors = ReadText(".stderr");
        std::filesystem::remove(Path(".stdout"));
        std::filesystem::remove(Path(".stderr"));
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

    // Bad input: exit code 2, one line on standard error that names `what`, and no `output`.
    void ExpectRefused(const std::string& args, const std::string& what, const std::string& outputFile = "out.png") {
        SCOPED_TRACE(args);
        EXPECT_EQ(Run(args), 2);
        EXPECT_EQ(std::count(errors.begin(), errors.end(), '\n'), 1) << errors;
        EXPECT_NE(errors.find(what), std::string::npos) << errors;
        EXPECT_FALSE(std::filesystem::exists(Path(outputFile))) << outputFile;
    }

    // Runs a command that must succeed silently and loads the image it wrote.
    CImage RunForImage(const std::string& args, const std::string& outputFile = "out.png") {
        SCOPED_TRACE(args);
        EXPECT_EQ(Run(args), 0) << errors;
        EXPECT_EQ(errors, "");
        CImage image;
        EXPECT_TRUE(image.ImportFile(Path(outputFile))) << outputFile;
        std::filesystem::remove(Path(outputFile));
        return image;
    }

    // A textured picture (every pixel byte from a small generator) written as `name`.
    void WriteNoise(const std::string& name, int width, int height, int bits, uint32_t seed = 1) {
        CImage image(width, height, bits);
        for (int y = 0; y < height; ++y) {
            unsigned char* row = image.GetPtrXY(0, y);
            for (int i = 0; i < width * bits / 8; ++i) {
                seed = seed * 1664525u + 1013904223u;
                row[i] = static_cast<unsigned char>(seed >> 24);
            }
        }
        ASSERT_TRUE(image.ExportFile(Path(name)));
    }

    void WriteText(const std::string& name, const std::string& text) { std::ofstream(Path(name)) << text; }

    std::filesystem::path dir;
    std::string output, errors;

private:
    std::string ReadText(const std::string& name) const {
        std::ifstream in(Path(name));
        return std::string(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
    }
};

// Width, height and depth of an image, for one-line comparisons.
inline std::string Geometry(const CImage& image) {
    return std::to_string(image.GetWidth()) + "x" + std::to_string(image.GetHeight()) + "x" +
           std::to_string(image.GetBitCount());
}
