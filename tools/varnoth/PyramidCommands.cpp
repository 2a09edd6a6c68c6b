// fuse, stitch: multi-image fusion through Laplacian pyramids.
#include <cmath>
#include <string>

#include "pyramid/Fusion.h"
#include "varnoth/Commands.h"
#include "varnoth/ToolIO.h"

namespace {

constexpr int kMaxLevels = 30;
// Placements beyond any image; keeps the fusion's offset arithmetic far from int overflow.
constexpr double kMaxOffset = 1e6;

void RequireLevels(int levels) {
    if (levels < 1 || levels > kMaxLevels)
        throw ToolError("--levels " + std::to_string(levels) + ": use 1 to " + std::to_string(kMaxLevels));
}

std::string TooSmall(const std::string& path, const CImage& image, int levels, int minimum) {
    return path + ": " + std::to_string(image.GetWidth()) + " x " + std::to_string(image.GetHeight()) +
           " is too small for " + std::to_string(levels) + " levels (needs more than " +
           std::to_string(1 << levels) + " pixels both ways" +
           (minimum > 0 ? " and at least " + std::to_string(minimum) + " x " + std::to_string(minimum) : "") + ")";
}

void AddFuseCommand(CLI::App& app) {
    struct Args {
        std::string a, b, map, out;
        int levels = 6;
        bool negate = false;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd =
        app.add_subcommand("fuse", "Fuse two shots of one document: the sharper detail wins at every pixel");
    cmd->add_option("A", args->a, "First image (8- or 24-bit)")->required();
    cmd->add_option("B", args->b, "Second image (same size and depth as A)")->required();
    cmd->add_option("--map", args->map, "8-bit blend map of the images' size: 0 takes A, 255 takes B");
    cmd->add_option("--levels", args->levels, "Pyramid levels, 1 to 30 (default 6)");
    cmd->add_flag("--negate", args->negate,
                  "Keep B's detail only where A has little of its own, without the low-pass content "
                  "(images at least 101 x 101)");
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->callback([args] {
        RequireLevels(args->levels);
        if (args->negate && !args->map.empty()) throw ToolError("--map and --negate cannot be combined");
        const CImage a = LoadImage(args->a);
        const CImage b = LoadImage(args->b);
        RequireSameGeometry(a, args->a, b, args->b);
        CFusion fusion(args->levels, 2);
        if (!args->map.empty()) {
            const CImage map = LoadImageAs(args->map, 8, false);
            if (map.GetWidth() != a.GetWidth() || map.GetHeight() != a.GetHeight())
                throw ToolError(args->map + ": the map is " + std::to_string(map.GetWidth()) + " x " +
                                std::to_string(map.GetHeight()) + ", the images " + std::to_string(a.GetWidth()) +
                                " x " + std::to_string(a.GetHeight()));
            fusion.SetMap(map);
        }
        const int minimum = args->negate ? 101 : 0;
        for (const auto* image : {&a, &b}) {
            const bool accepted = args->negate ? fusion.NegateImage(*image) : fusion.AddImage(*image, CPoint());
            if (!accepted) throw ToolError(TooSmall(image == &a ? args->a : args->b, *image, args->levels, minimum));
        }
        SaveImage(fusion.Fuse(), args->out);
    });
}

void AddStitchCommand(CLI::App& app) {
    struct Args {
        std::string topLeft, topRight, bottomLeft, bottomRight, offsets, out;
        int levels = 6;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd =
        app.add_subcommand("stitch", "Stitch four shots into one image twice as wide, the seams blended by the pyramids");
    cmd->footer(
        "The upper half takes TOP_LEFT's pixels up to its x offset (ending at the middle) and TOP_RIGHT's from its "
        "x offset on; the lower half likewise from BOTTOM_LEFT and BOTTOM_RIGHT. Each image's rows move up by its "
        "y offset - 150; rows no image reaches stay white.");
    cmd->add_option("TOP_LEFT", args->topLeft, "Image for the upper left quarter")->required();
    cmd->add_option("TOP_RIGHT", args->topRight, "Image for the upper right quarter")->required();
    cmd->add_option("BOTTOM_LEFT", args->bottomLeft, "Image for the lower left quarter")->required();
    cmd->add_option("BOTTOM_RIGHT", args->bottomRight, "Image for the lower right quarter")->required();
    cmd->add_option("--offsets", args->offsets,
                    "Placement x,y of each image, in the order of the images: x0,y0,x1,y1,x2,y2,x3,y3")
        ->required();
    cmd->add_option("--levels", args->levels, "Pyramid levels, 1 to 30 (default 6)");
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->callback([args] {
        RequireLevels(args->levels);
        const std::vector<double> offsets = ParseNumberList(args->offsets, 8, "--offsets");
        for (double v : offsets)
            if (!(std::fabs(v) <= kMaxOffset) || v != std::floor(v))
                throw ToolError("--offsets: '" + args->offsets + "' must hold whole numbers from -1000000 to 1000000");
        // The fusion's slots: 0 lower right, 1 upper right, 2 lower left, 3 upper left.
        const std::string* paths[4] = {&args->bottomRight, &args->topRight, &args->bottomLeft, &args->topLeft};
        const int order[4] = {3, 1, 2, 0};  // the slot's position on the command line
        CImage images[4];
        for (int slot = 0; slot < 4; ++slot) images[slot] = LoadImage(*paths[slot]);
        for (int slot = 1; slot < 4; ++slot) RequireSameGeometry(images[0], *paths[0], images[slot], *paths[slot]);
        CFusion fusion(args->levels, 4);
        for (int slot = 0; slot < 4; ++slot) {
            const int at = 2 * order[slot];
            const CPoint place(static_cast<int>(offsets[at]), static_cast<int>(offsets[at + 1]));
            if (!fusion.AddImage(images[slot], place))
                throw ToolError(TooSmall(*paths[slot], images[slot], args->levels, 0));
        }
        SaveImage(fusion.Fuse(), args->out);
    });
}

}  // namespace

void RegisterPyramidCommands(CLI::App& app) {
    AddFuseCommand(app);
    AddStitchCommand(app);
}
