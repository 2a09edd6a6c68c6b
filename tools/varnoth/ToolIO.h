#pragma once

#include <stdexcept>
#include <string>
#include <vector>

#include "imagelib/CImage.h"

// Bad input to the tool: main prints "varnoth: error: <message>" and exits with code 2.
struct ToolError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Reads an image file (PNG, JPEG, BMP, TIFF); throws ToolError naming the file and reason.
CImage LoadImage(const std::string& path);
// As LoadImage, and requires the given bit count (8 or 24); 8-bit inputs are widened to
// 24 bits (and 24-bit narrowed to their luma) when `convert` is true.
CImage LoadImageAs(const std::string& path, int bits, bool convert = true);
// Writes through a temporary file in the same directory and renames it into place, so a
// failure never leaves a half-written output. Throws ToolError on failure.
void SaveImage(const CImage& image, const std::string& path);
// Throws ToolError unless the two images have the same width, height and bit count.
void RequireSameGeometry(const CImage& a, const std::string& aPath, const CImage& b, const std::string& bPath);
// Parses "a,b,c" into exactly `count` numbers; throws ToolError naming `what` otherwise.
std::vector<double> ParseNumberList(const std::string& text, size_t count, const std::string& what);
