// add, subtract, stretch, insert: whole-image arithmetic on image files.
#include <cstdio>

#include "frame/ImageArithmetic.h"
#include "varnoth/Commands.h"
#include "varnoth/ToolIO.h"

namespace {

struct TwoImageArgs {
    std::string a, b, out;
};

void AddTwoImageCommand(CLI::App& app, const char* name, const char* help,
                        void (*operation)(const CImage&, const CImage&, CImage&)) {
    auto args = std::make_shared<TwoImageArgs>();
    CLI::App* cmd = app.add_subcommand(name, help);
    cmd->add_option("A", args->a, "First image")->required();
    cmd->add_option("B", args->b, "Second image (same size and depth as A)")->required();
    cmd->add_option("-o,--output", args->out, "Output image (.png, .jpg, .bmp, .tif)")->required();
    cmd->callback([args, operation] {
        const CImage a = LoadImage(args->a);
        const CImage b = LoadImage(args->b);
        RequireSameGeometry(a, args->a, b, args->b);
        CImage out;
        operation(a, b, out);
        SaveImage(out, args->out);
    });
}

void AddStretchCommand(CLI::App& app) {
    auto args = std::make_shared<TwoImageArgs>();
    CLI::App* cmd = app.add_subcommand("stretch", "Contrast stretch from the range of the central window");
    cmd->add_option("IMAGE", args->a, "Input image")->required();
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->callback([args] {
        CImage img = LoadImage(args->a);
        ImageStretch(img);
        SaveImage(img, args->out);
    });
}

void AddInsertCommand(CLI::App& app) {
    struct Args {
        std::string src, dst, mask, out, at = "0,0";
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = app.add_subcommand("insert", "Copy SRC into DST at a position, optionally where MASK is 0");
    cmd->add_option("SRC", args->src, "Image to insert")->required();
    cmd->add_option("DST", args->dst, "Image to insert into")->required();
    cmd->add_option("--at", args->at, "Position x,y of SRC's top-left pixel in DST (default 0,0)");
    cmd->add_option("--mask", args->mask, "Mask image of SRC's size and depth: bytes are copied where it is 0");
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->callback([args] {
        const CImage src = LoadImage(args->src);
        CImage dst = LoadImage(args->dst);
        const std::vector<double> at = ParseNumberList(args->at, 2, "--at");
        CImage mask;
        if (!args->mask.empty()) {
            mask = LoadImage(args->mask);
            RequireSameGeometry(src, args->src, mask, args->mask);
        }
        if (!InsertImage(src, dst, CPoint(static_cast<int>(at[0]), static_cast<int>(at[1])),
                         args->mask.empty() ? nullptr : &mask))
            throw ToolError(args->src + ": does not fit into " + args->dst +
                            " at that position (it must stay one pixel inside the right and bottom edges, "
                            "with the same depth)");
        SaveImage(dst, args->out);
    });
}

}  // namespace

void RegisterFrameCommands(CLI::App& app) {
    AddTwoImageCommand(app, "add", "Per byte A + B - 127, clamped (recombines a detail image)", [](const CImage& a, const CImage& b, CImage& out) { ImageAdd(a, b, out); });
    AddTwoImageCommand(app, "subtract", "Per byte A - B + 128, clamped (a difference image centred on 128)",
                       ImageSubtract);
    AddStretchCommand(app);
    AddInsertCommand(app);
}
