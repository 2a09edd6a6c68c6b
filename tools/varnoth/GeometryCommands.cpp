// warp affine, warp radial, seam, hills: geometric correction and the three-level threshold.
#include <algorithm>
#include <cfloat>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "geometry/Geometry.h"
#include "varnoth/Commands.h"
#include "varnoth/ToolIO.h"

namespace {

constexpr int kMaxSide = 65535;       // largest output side the tool will allocate
constexpr double kMaxPixels = 1 << 28;  // largest output area (768 MB in colour)

void RequireOutputSize(double width, double height, const std::string& what) {
    if (width <= kMaxSide && height <= kMaxSide && width * height <= kMaxPixels) return;
    char text[128];
    std::snprintf(text, sizeof text, ": the output would be about %.6g x %.6g pixels (at most %d a side, %.0f in all)",
                  width, height, kMaxSide, kMaxPixels);
    throw ToolError(what + text);
}

// The size --fit gives the output: the box around the source corners mapped back through m.
// Checked before WarpAffine allocates it; a singular map is left to WarpAffine to refuse.
void RequireFittedSize(const std::vector<float>& m, const CImage& src) {
    const double det = static_cast<double>(m[0]) * m[4] - static_cast<double>(m[1]) * m[3];
    if (det == 0.0) return;
    const double i00 = m[4] / det, i01 = -m[1] / det, i10 = -m[3] / det, i11 = m[0] / det;
    const double xs[4] = {0.0, src.GetWidth() - 1.0, src.GetWidth() - 1.0, 0.0};
    const double ys[4] = {0.0, 0.0, src.GetHeight() - 1.0, src.GetHeight() - 1.0};
    double lowX = HUGE_VAL, highX = -HUGE_VAL, lowY = HUGE_VAL, highY = -HUGE_VAL;
    for (int k = 0; k < 4; ++k) {
        const double x = i00 * (xs[k] - m[2]) + i01 * (ys[k] - m[5]);
        const double y = i10 * (xs[k] - m[2]) + i11 * (ys[k] - m[5]);
        lowX = std::min(lowX, x), highX = std::max(highX, x);
        lowY = std::min(lowY, y), highY = std::max(highY, y);
    }
    RequireOutputSize(highX - lowX + 1.0, highY - lowY + 1.0, "--matrix with --fit");
}

// `count` numbers that fit a float.
std::vector<float> ParseFloats(const std::string& text, size_t count, const std::string& what) {
    std::vector<float> values;
    for (double v : ParseNumberList(text, count, what)) {
        if (!std::isfinite(v) || std::fabs(v) > FLT_MAX) throw ToolError(what + ": '" + text + "' holds a non-finite number");
        values.push_back(static_cast<float>(v));
    }
    return values;
}

// "A<sep>B" as two numbers, e.g. "100x80" or "10.5:900".
std::vector<double> ParsePair(const std::string& text, char separator, const std::string& what) {
    const size_t at = text.find(separator);
    if (at == std::string::npos || text.find(separator, at + 1) != std::string::npos)
        throw ToolError(what + ": expected two numbers separated by '" + separator + "', got '" + text + "'");
    return {ParseNumberList(text.substr(0, at), 1, what)[0], ParseNumberList(text.substr(at + 1), 1, what)[0]};
}

void AddWarpAffineCommand(CLI::App& warp) {
    struct Args {
        std::string in, out, matrix, shift;
        bool fit = false;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = warp.add_subcommand(
        "affine",
        "Resample through an affine map: output pixel (X, Y) reads source position (a0*X + a1*Y + a2, "
        "a3*X + a4*Y + a5), bilinear; bytes are capped at 254. Without --fit the output has the input's size "
        "and pixels whose source lies outside stay black.");
    cmd->add_option("IN", args->in, "Input image (8- or 24-bit)")->required();
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->add_option("--matrix", args->matrix, "The map a0,a1,a2,a3,a4,a5")->required();
    cmd->add_flag("--fit", args->fit,
                  "Size the output to hold the whole transformed image and print where the input's corners land");
    cmd->add_option("--shift", args->shift,
                    "Extra shift x,y: the fraction moves the sampling, a negative whole part moves the content "
                    "right / down");
    cmd->callback([args] {
        const std::vector<float> m = ParseFloats(args->matrix, 6, "--matrix");
        SPoint shift;
        if (!args->shift.empty()) {
            const std::vector<float> xy = ParseFloats(args->shift, 2, "--shift");
            shift = SPoint(xy[0], xy[1]);
        }
        const CImage src = LoadImage(args->in);
        if (args->fit) RequireFittedSize(m, src);
        CImage dst(src.GetWidth(), src.GetHeight(), src.GetBitCount());
        CPoint corners[4];
        if (!WarpAffine(m.data(), src, dst, args->fit, args->shift.empty() ? nullptr : &shift, corners))
            throw ToolError(std::string(args->shift.empty() ? "--matrix" : "--matrix with --shift") +
                            ": the map cannot be applied (singular with --fit, or the output window is empty)");
        if (args->fit && dst.GetWidth() > 0) {
            std::printf("output %d x %d\n", dst.GetWidth(), dst.GetHeight());
            const char* names[4] = {"top-left", "top-right", "bottom-right", "bottom-left"};
            for (int k = 0; k < 4; ++k) std::printf("%-12s -> %d,%d\n", names[k], corners[k].x, corners[k].y);
        }
        SaveImage(dst, args->out);
    });
}

void AddWarpRadialCommand(CLI::App& warp) {
    struct Args {
        std::string in, out, k, centre = "0,0", scale;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = warp.add_subcommand(
        "radial",
        "Correct radial lens distortion f(r^2) = k1*r^2 + k2*r^4 + k3*r^6 about a centre, in coordinates "
        "running from -1 to +1 across the image. Without --scale every source pixel is moved forward "
        "(white where none lands); with --scale the output is sampled backward, bilinear, at the given size.");
    cmd->add_option("IN", args->in, "Input image (8- or 24-bit)")->required();
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->add_option("--k", args->k, "Coefficients k1,k2,k3")->required();
    cmd->add_option("--centre", args->centre, "Centre cx,cy in -1 … +1 (default 0,0)");
    cmd->add_option("--scale", args->scale, "Output size WxH (backward bilinear mapping)");
    cmd->callback([args] {
        const std::vector<float> k = ParseFloats(args->k, 3, "--k");
        const std::vector<float> centre = ParseFloats(args->centre, 2, "--centre");
        const float p[5] = {k[0], k[1], k[2], centre[0], centre[1]};
        const CImage src = LoadImage(args->in);
        CImage dst;
        if (args->scale.empty()) {
            dst.Reallocate(src.GetWidth(), src.GetHeight(), src.GetBitCount(), 0);
            if (!WarpRadial(p, src, dst)) throw ToolError(args->in + ": the image cannot be warped");
        } else {
            const std::vector<double> size = ParsePair(args->scale, 'x', "--scale");
            for (double v : size)
                if (v != std::floor(v) || v < 1 || v > kMaxSide)
                    throw ToolError("--scale: '" + args->scale + "' must be two whole sizes from 1 to " +
                                    std::to_string(kMaxSide));
            RequireOutputSize(size[0], size[1], "--scale");
            dst.Reallocate(static_cast<int>(size[0]), static_cast<int>(size[1]), src.GetBitCount(), 0);
            if (!WarpRadialAndScale(p, src, dst)) throw ToolError(args->in + ": the image cannot be warped");
        }
        SaveImage(dst, args->out);
    });
}

void AddSeamCommand(CLI::App& app) {
    struct Args {
        std::string in, out, curve, columns;
        float angle = 0.0f;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = app.add_subcommand(
        "seam", "Straighten the seam of a two-sensor scan, then rotate it");
    cmd->footer(
        "Straightens the join along the curve y = q0*x^2 + q1*x + q2 measured over columns x0 to x1, then rotates "
        "by --angle degrees and turns the result a quarter clockwise.");
    cmd->add_option("IN", args->in, "Input image (8- or 24-bit)")->required();
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->add_option("--curve", args->curve, "Seam curve q0,q1,q2")->required();
    cmd->add_option("--columns", args->columns, "Measured columns x0:x1 with x0 < x1")->required();
    cmd->add_option("--angle", args->angle, "Rotation in degrees, counter-clockwise (default 0)");
    cmd->callback([args] {
        const std::vector<float> q = ParseFloats(args->curve, 3, "--curve");
        const std::vector<double> columns = ParsePair(args->columns, ':', "--columns");
        if (!(columns[0] < columns[1]) || std::fabs(columns[0]) > 1e7 || std::fabs(columns[1]) > 1e7)
            throw ToolError("--columns: '" + args->columns + "' needs x0 < x1");
        if (!std::isfinite(args->angle)) throw ToolError("--angle must be a finite number");
        const CImage src = LoadImage(args->in);
        CImage dst;
        DualCMOSFixAlongCurve(src, dst, args->angle, 0.0f, q.data(),
                              SPoint(static_cast<float>(columns[0]), static_cast<float>(columns[1])));
        if (dst.IsEmpty()) throw ToolError(args->in + ": the seam could not be straightened (see --trace)");
        SaveImage(dst, args->out);
    });
}

void AddHillsCommand(CLI::App& app) {
    struct Args {
        std::string in, out;
        int threshold = 0;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = app.add_subcommand(
        "hills", "Three-level (hills-and-valleys) rendering of a grey image");
    cmd->footer(
        "Row by row: 200 after a strong rising edge, 0 after a strong falling edge, 100 before the first and from "
        "the last edge. Colour input is converted to grey.");
    cmd->add_option("IN", args->in, "Input image")->required();
    cmd->add_option("-o,--output", args->out, "Output 8-bit image")->required();
    cmd->add_option("--threshold", args->threshold, "Smallest derivative magnitude of an edge, exclusive")->required();
    cmd->callback([args] {
        CImage img = LoadImageAs(args->in, 8);
        HillsVallysThreshold(img, args->threshold);
        SaveImage(img, args->out);
    });
}

}  // namespace

void RegisterGeometryCommands(CLI::App& app) {
    CLI::App* warp = app.add_subcommand("warp", "Affine and radial warps");
    warp->require_subcommand(1);
    AddWarpAffineCommand(*warp);
    AddWarpRadialCommand(*warp);
    AddSeamCommand(app);
    AddHillsCommand(app);
}
