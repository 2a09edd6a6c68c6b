// ir, match-channels: the synthetic infrared picture and the alignment of colour planes.
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "channels/CheatIR.h"
#include "varnoth/Commands.h"
#include "varnoth/ToolIO.h"

namespace {

const char* kPlaneOrder =
    "A colour image is split into plane 0 = red, plane 1 = green, plane 2 = blue.";

struct PlaneArgs {
    std::string image;
    std::vector<std::string> planes;
};

void AddPlaneOptions(CLI::App* cmd, PlaneArgs& args) {
    CLI::Option* image = cmd->add_option("IMAGE", args.image, "24-bit colour image");
    CLI::Option* planes =
        cmd->add_option("--planes", args.planes, "Three grey images of one size as planes 0, 1, 2 instead of IMAGE")
            ->expected(3);
    image->excludes(planes);
}

// planes[0..2] = red, green, blue of a colour image, or the three grey files.
std::unique_ptr<CImage[]> LoadPlanes(const PlaneArgs& args) {
    auto planes = std::make_unique<CImage[]>(3);
    if (!args.planes.empty()) {
        for (int i = 0; i < 3; ++i) {
            planes[i] = LoadImageAs(args.planes[i], 8);
            if (i > 0) RequireSameGeometry(planes[0], args.planes[0], planes[i], args.planes[i]);
        }
        return planes;
    }
    if (args.image.empty()) throw ToolError("give IMAGE or --planes P0 P1 P2");
    const CImage colour = LoadImageAs(args.image, 24);
    const int width = colour.GetWidth(), height = colour.GetHeight();
    for (int i = 0; i < 3; ++i) planes[i].Reallocate(width, height, 8);
    for (int y = 0; y < height; ++y) {
        const unsigned char* bgr = colour.GetPtrXY(0, y);
        for (int x = 0; x < width; ++x, bgr += 3) {
            planes[0].GetPtrXY(0, y)[x] = bgr[2];
            planes[1].GetPtrXY(0, y)[x] = bgr[1];
            planes[2].GetPtrXY(0, y)[x] = bgr[0];
        }
    }
    return planes;
}

void AddIrCommand(CLI::App& app) {
    struct Args : PlaneArgs {
        std::string out;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = app.add_subcommand("ir", "Synthetic infrared picture from the colour planes");
    cmd->footer(std::string("Plane 0 with small features that are dark in planes 0 and 1 darkened further. ") +
                kPlaneOrder);
    AddPlaneOptions(cmd, *args);
    cmd->add_option("-o,--output", args->out, "Output grey image")->required();
    cmd->callback([args] {
        const std::unique_ptr<CImage[]> planes = LoadPlanes(*args);
        CCheatIR cheat;
        if (!cheat.CheatCreate(planes.get())) throw ToolError("the planes cannot make a synthetic infrared picture");
        SaveImage(cheat.GetCheat(), args->out);
    });
}

std::string OffsetText(const std::optional<CPoint>& offset) {
    if (!offset) return "none";
    char text[32];
    std::snprintf(text, sizeof text, "%+d,%+d", offset->x, offset->y);
    return text;
}

std::string OffsetJson(const std::optional<CPoint>& offset) {
    if (!offset) return "null";
    char text[48];
    std::snprintf(text, sizeof text, "{\"dx\": %d, \"dy\": %d}", offset->x, offset->y);
    return text;
}

void PrintGrades(const std::vector<SSegmentGrades>& grades, bool json) {
    if (json) std::printf("{\"segments\": [");
    for (size_t i = 0; i < grades.size(); ++i) {
        const SSegmentGrades& g = grades[i];
        const RECT& r = g.rect;
        if (json) {
            std::printf("%s\n  {\"left\": %d, \"top\": %d, \"right\": %d, \"bottom\": %d, \"points\": %d, "
                        "\"clipped\": %s, \"plane0\": %s, \"plane2\": %s}",
                        i == 0 ? "" : ",", r.left, r.top, r.right, r.bottom, g.pointCount,
                        g.clipped ? "true" : "false", OffsetJson(g.BestOffset(0)).c_str(),
                        OffsetJson(g.BestOffset(1)).c_str());
        } else {
            std::printf("segment %zu: box %d,%d-%d,%d points %d plane0 %s plane2 %s%s\n", i, r.left, r.top, r.right,
                        r.bottom, g.pointCount, OffsetText(g.BestOffset(0)).c_str(),
                        OffsetText(g.BestOffset(1)).c_str(), g.clipped ? " (points at the border)" : "");
        }
    }
    if (json) std::printf("%s]}\n", grades.empty() ? "" : "\n");
}

void AddMatchChannelsCommand(CLI::App& app) {
    struct Args : PlaneArgs {
        std::string dumpDir;
        bool json = false;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd =
        app.add_subcommand("match-channels", "How well colour planes 0 and 2 line up with plane 1, per stroke");
    cmd->footer(std::string("Finds the dark strokes of plane 1 and reports, per stroke segment, its box (inclusive), "
                            "its number of sampled points and the offset dx,dy at which plane 0 and plane 2 best "
                            "match plane 1 (none when a point lies less than 12 pixels from the border, or nothing "
                            "was graded). ") +
                kPlaneOrder);
    AddPlaneOptions(cmd, *args);
    cmd->add_option("--dump-dir", args->dumpDir, "Write the debug pictures (groups, maps) under this directory");
    cmd->add_flag("--json", args->json, "Print the segments as JSON");
    cmd->callback([args] {
        const std::unique_ptr<CImage[]> planes = LoadPlanes(*args);
        if (!args->dumpDir.empty()) setenv("VARNOTH_DUMP_DIR", args->dumpDir.c_str(), 1);
        CCheatIR cheat;
        std::vector<SSegmentGrades> grades;
        if (!cheat.MatchChannels(planes.get(), &grades)) throw ToolError("the planes cannot be matched");
        PrintGrades(grades, args->json);
    });
}

}  // namespace

void RegisterChannelCommands(CLI::App& app) {
    AddIrCommand(app);
    AddMatchChannelsCommand(app);
}
