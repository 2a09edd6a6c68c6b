// holo4: glare-free composites from four directionally lit shots.
#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <memory>

#include "imagelib/StopWatch.h"
#include "varnoth/Commands.h"
#include "varnoth/FourImageMethods.h"
#include "varnoth/ToolIO.h"
#include "varnoth/TwoImageMethods.h"

namespace {

void AddHolo4Command(CLI::App& app) {
    struct Args {
        std::string shots[4], out, method = "pyramid";
    };
    auto args = std::make_shared<Args>();
    std::string methodHelp = "Composition method (default pyramid):";
    for (const FourImageMethod& m : FourImageMethods()) methodHelp += std::string("\n  ") + m.name + ": " + m.description;
    CLI::App* cmd = app.add_subcommand(
        "holo4", "Compose one glare-free image from four shots lit from the top, bottom, left and right");
    cmd->add_option("TOP", args->shots[0], "Shot lit from the top")->required();
    cmd->add_option("BOTTOM", args->shots[1], "Shot lit from the bottom")->required();
    cmd->add_option("LEFT", args->shots[2], "Shot lit from the left")->required();
    cmd->add_option("RIGHT", args->shots[3], "Shot lit from the right")->required();
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->add_option("--method", args->method, methodHelp);
    cmd->callback([args] {
        const FourImageMethod* method = FindFourImageMethod(args->method);
        if (!method) throw ToolError("unknown --method '" + args->method + "' (use " + FourImageMethodNames() + ")");
        CImage shots[4];
        for (int i = 0; i < 4; ++i) {
            shots[i] = LoadImageAs(args->shots[i], 24);
            if (i > 0) RequireSameGeometry(shots[0], args->shots[0], shots[i], args->shots[i]);
        }
        const CImage* const order[4] = {&shots[0], &shots[1], &shots[2], &shots[3]};
        CHologramsRemove remover;
        CImage result;
        CStopWatch watch;
        method->run(remover, order, result);
        const double ms = watch.ElapsedMicro() / 1000.0;
        if (result.IsEmpty())
            throw ToolError(std::string("the shots are too small for --method ") + method->name +
                            " (the pyramid methods need at least 65 x 65 pixels, brightness 4 columns)");
        SaveImage(result, args->out);
        std::printf("holo4 %s: %d x %d in %.1f ms -> %s\n", method->name, result.GetWidth(), result.GetHeight(), ms,
                    args->out.c_str());
    });
}

// holo2 and edges: glare separation and edge classification from two shots.

// "TOP:BOTTOM" within [0, height]; empty means the whole height.
void ParseRows(const std::string& text, int height, int& top, int& bottom) {
    top = 0;
    bottom = height;
    if (text.empty()) return;
    const size_t colon = text.find(':');
    try {
        if (colon == std::string::npos) throw std::invalid_argument("no colon");
        size_t used = 0;
        top = std::stoi(text.substr(0, colon), &used);
        if (used != colon) throw std::invalid_argument("top");
        bottom = std::stoi(text.substr(colon + 1), &used);
        if (used != text.size() - colon - 1) throw std::invalid_argument("bottom");
    } catch (const std::exception&) {
        throw ToolError("--rows must be TOP:BOTTOM, for example 100:3400 (got '" + text + "')");
    }
    if (top < 0 || bottom > height || top >= bottom)
        throw ToolError("--rows must satisfy 0 <= TOP < BOTTOM <= " + std::to_string(height) + " (got '" + text + "')");
}

void LoadPair(const std::string& path1, const std::string& path2, CImage& image1, CImage& image2) {
    image1 = LoadImageAs(path1, 24);
    image2 = LoadImageAs(path2, 24);
    RequireSameGeometry(image1, path1, image2, path2);
    if (image1.GetWidth() < 16 || image1.GetHeight() < 16)
        throw ToolError("the shots must be at least 16 x 16 pixels (got " + std::to_string(image1.GetWidth()) + " x " +
                        std::to_string(image1.GetHeight()) + ")");
}

void AddHolo2Command(CLI::App& app) {
    struct Args {
        std::string image1, image2, out, method = "detect", rows;
    };
    auto args = std::make_shared<Args>();
    std::string methodHelp = "Separation method (default detect):";
    for (const TwoImageMethod& m : TwoImageMethods()) methodHelp += std::string("\n  ") + m.name + ": " + m.description;
    CLI::App* cmd = app.add_subcommand(
        "holo2", "Remove the glare from two aligned shots of one document taken under different light");
    cmd->add_option("IMG1", args->image1, "First shot")->required();
    cmd->add_option("IMG2", args->image2, "Second shot, of the same size")->required();
    cmd->add_option("-o,--output", args->out, "Output image")->required();
    cmd->add_option("--method", args->method, methodHelp);
    cmd->add_option("--rows", args->rows, "Document rows TOP:BOTTOM (default: the whole height)");
    cmd->callback([args] {
        const TwoImageMethod* method = FindTwoImageMethod(args->method);
        if (!method) throw ToolError("unknown --method '" + args->method + "' (use " + TwoImageMethodNames() + ")");
        CImage image1, image2;
        LoadPair(args->image1, args->image2, image1, image2);
        int top = 0, bottom = 0;
        ParseRows(args->rows, image1.GetHeight(), top, bottom);
        int score1 = 0, score2 = 0;
        {
            CHologramsRemove scorer;
            TwoImageGlareScores(scorer, image1, image2, top, bottom, score1, score2);
        }
        CHologramsRemove remover;
        CStopWatch watch;
        method->run(remover, image1, image2, top, bottom);
        const double ms = watch.ElapsedMicro() / 1000.0;
        SaveImage(image1, args->out);
        std::printf("holo2 %s: %d x %d, glare scores image 1 = %d, image 2 = %d, %.1f ms -> %s\n", method->name,
                    image1.GetWidth(), image1.GetHeight(), score1, score2, ms, args->out.c_str());
    });
}

int CountMarkedBytes(const CImage& mask) {
    int n = 0;
    for (int y = 0; y < mask.GetHeight(); ++y) {
        const unsigned char* p = mask.GetPtrXY(0, y);
        for (int i = 0; i < 3 * mask.GetWidth(); ++i) n += p[i] != 0;
    }
    return n;
}

void AddEdgesCommand(CLI::App& app) {
    struct Args {
        std::string image1, image2, out, second, direction = "both";
        int threshold = 10, border = 6;
    };
    auto args = std::make_shared<Args>();
    CLI::App* cmd = app.add_subcommand(
        "edges", "Mark the edges that only one of two shots shows (gradient edge classifier)");
    cmd->add_option("IMG1", args->image1, "First shot")->required();
    cmd->add_option("IMG2", args->image2, "Second shot, of the same size")->required();
    cmd->add_option("-o,--output", args->out,
                    "Edge mask of shot 1: 24-bit, per channel 250 on a rising and 200 on a falling edge that shot 2 "
                    "lacks")
        ->required();
    cmd->add_option("--second", args->second, "Also write the edge mask of shot 2 here");
    cmd->add_option("--threshold", args->threshold,
                    "Edge strength t: one shot's gradient beyond 2t while the other's stays within t (default 10)")
        ->check(CLI::NonNegativeNumber);
    cmd->add_option("--border", args->border, "Rows and columns left out at each edge, at least 6 (default 6)");
    cmd->add_option("--direction", args->direction,
                    "Gradients compared: h (horizontal), v (vertical) or both, vertical after horizontal (default)");
    cmd->callback([args] {
        if (args->direction != "h" && args->direction != "v" && args->direction != "both")
            throw ToolError("--direction must be h, v or both (got '" + args->direction + "')");
        if (args->border < 6) throw ToolError("--border must be at least 6, the reach of the vertical gradient");
        if (args->threshold < 0 || args->threshold > 255)
            throw ToolError("--threshold must be 0 to 255 (gradients are bytes centred on 128)");
        CImage image1, image2;
        LoadPair(args->image1, args->image2, image1, image2);
        if (2 * static_cast<int64_t>(args->border) >= std::min(image1.GetWidth(), image1.GetHeight()))
            throw ToolError("--border leaves nothing of the shots to compare");
        CHologramsRemove remover;
        CStopWatch watch;
        CImage h1, v1, h2, v2;
        remover.GradImg_24(image1, h1, v1, args->border);
        remover.GradImg_24(image2, h2, v2, args->border);
        CImage edges1(image1.GetWidth(), image1.GetHeight(), 24), edges2(image1.GetWidth(), image1.GetHeight(), 24);
        if (args->direction != "v") remover.MapHologramsEdges_24(h1, h2, edges1, edges2, args->border, args->threshold);
        if (args->direction != "h") remover.MapHologramsEdges_24(v1, v2, edges1, edges2, args->border, args->threshold);
        const double ms = watch.ElapsedMicro() / 1000.0;
        SaveImage(edges1, args->out);
        if (args->second.empty()) return;
        try {
            SaveImage(edges2, args->second);
        } catch (const ToolError&) {
            std::error_code ignored;
            std::filesystem::remove(args->out, ignored);  // both masks or neither
            throw;
        }
        std::printf("edges: %d x %d, marked sub-pixels shot 1 = %d, shot 2 = %d, %.1f ms -> %s\n", image1.GetWidth(),
                    image1.GetHeight(), CountMarkedBytes(edges1), CountMarkedBytes(edges2), ms, args->out.c_str());
    });
}

}  // namespace

void RegisterHologramCommands(CLI::App& app) {
    AddHolo4Command(app);
    AddHolo2Command(app);
    AddEdgesCommand(app);
}
