#include "varnoth/ToolIO.h"

#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <sstream>

CImage LoadImage(const std::string& path) {
    CImage image;
    std::string reason;
    if (!image.ImportFile(path, &reason)) throw ToolError(path + ": " + reason);
    return image;
}

namespace {

CImage ToGrey(const CImage& colour) {
    CImage grey(colour.GetWidth(), colour.GetHeight(), 8);
    for (int y = 0; y < colour.GetHeight(); ++y) {
        const unsigned char* in = colour.GetPtrXY(0, y);
        unsigned char* out = grey.GetPtrXY(0, y);
        for (int x = 0; x < colour.GetWidth(); ++x, in += 3)
            out[x] = static_cast<unsigned char>((29 * in[0] + 150 * in[1] + 77 * in[2] + 128) >> 8);
    }
    return grey;
}

CImage ToColour(const CImage& grey) {
    CImage colour(grey.GetWidth(), grey.GetHeight(), 24);
    for (int y = 0; y < grey.GetHeight(); ++y) {
        const unsigned char* in = grey.GetPtrXY(0, y);
        unsigned char* out = colour.GetPtrXY(0, y);
        for (int x = 0; x < grey.GetWidth(); ++x) out[3 * x] = out[3 * x + 1] = out[3 * x + 2] = in[x];
    }
    return colour;
}

}  // namespace

CImage LoadImageAs(const std::string& path, int bits, bool convert) {
    CImage image = LoadImage(path);
    if (image.GetBitCount() == bits) return image;
    if (!convert)
        throw ToolError(path + ": expected a " + std::to_string(bits) + "-bit image, got " +
                        std::to_string(image.GetBitCount()) + "-bit");
    return bits == 8 ? ToGrey(image) : ToColour(image);
}

void SaveImage(const CImage& image, const std::string& path) {
    namespace fs = std::filesystem;
    const fs::path target(path);
    const std::string ext = target.extension().string();
    if (ext.empty()) throw ToolError(path + ": no file extension (use .png, .jpg, .bmp or .tif)");
    const fs::path temp = target.parent_path() / ("." + target.stem().string() + ".tmp" + std::to_string(getpid()) + ext);
    if (!image.ExportFile(temp.string())) {
        std::error_code ec;
        fs::remove(temp, ec);
        throw ToolError(path + ": cannot write this image in that format or place");
    }
    std::error_code ec;
    fs::rename(temp, target, ec);
    if (ec) {
        fs::remove(temp, ec);
        throw ToolError(path + ": cannot write: " + ec.message());
    }
}

void RequireSameGeometry(const CImage& a, const std::string& aPath, const CImage& b, const std::string& bPath) {
    if (a.GetWidth() == b.GetWidth() && a.GetHeight() == b.GetHeight() && a.GetBitCount() == b.GetBitCount()) return;
    std::ostringstream text;
    text << bPath << ": is " << b.GetWidth() << "x" << b.GetHeight() << " " << b.GetBitCount() << "-bit, but "
         << aPath << " is " << a.GetWidth() << "x" << a.GetHeight() << " " << a.GetBitCount() << "-bit";
    throw ToolError(text.str());
}

std::vector<double> ParseNumberList(const std::string& text, size_t count, const std::string& what) {
    std::vector<double> values;
    std::stringstream in(text);
    std::string item;
    while (std::getline(in, item, ',')) {
        char* end = nullptr;
        errno = 0;
        const double v = std::strtod(item.c_str(), &end);
        if (item.empty() || end == nullptr || *end != '\0' || errno != 0)
            throw ToolError(what + ": '" + item + "' is not a number");
        values.push_back(v);
    }
    if (values.size() != count)
        throw ToolError(what + ": expected " + std::to_string(count) + " comma-separated numbers, got '" + text + "'");
    return values;
}
