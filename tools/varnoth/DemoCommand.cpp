// demo: a generated identity card photographed under four lights, through every four-image
// glare removal method, scored against the card under even light.
#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

#include "imagelib/StopWatch.h"
#include "scene/Ranking.h"
#include "scene/Scene.h"
#include "varnoth/Commands.h"
#include "varnoth/FourImageMethods.h"
#include "varnoth/ToolIO.h"
#include "varnoth/TwoImageMethods.h"

namespace {

struct DemoArgs {
    std::string outDir = "varnoth-demo";
    std::string size = "1240x1754";
    uint32_t seed = 1;
};

void ParseSize(const std::string& text, int& w, int& h) {
    const size_t x = text.find_first_of("xX");
    try {
        if (x == std::string::npos) throw std::invalid_argument("no x");
        size_t used = 0;
        w = std::stoi(text.substr(0, x), &used);
        if (used != x) throw std::invalid_argument("width");
        h = std::stoi(text.substr(x + 1), &used);
        if (used != text.size() - x - 1) throw std::invalid_argument("height");
    } catch (const std::exception&) {
        throw ToolError("--size must be WIDTHxHEIGHT, for example 1240x1754 (got '" + text + "')");
    }
    if (w < 65 || h < 65 || w > 10000 || h > 10000)
        throw ToolError("--size must be between 65x65 and 10000x10000 (got '" + text + "')");
}

// Half-size copy by 2 x 2 box averages, for the montage's grid of shots.
CImage HalfSize(const CImage& src) {
    CImage half(src.GetWidth() / 2, src.GetHeight() / 2, 24);
    for (int y = 0; y < half.GetHeight(); ++y) {
        const unsigned char* a = src.GetPtrXY(0, 2 * y);
        const unsigned char* b = src.GetPtrXY(0, 2 * y + 1);
        unsigned char* out = half.GetPtrXY(0, y);
        for (int x = 0; x < 3 * half.GetWidth(); ++x) {
            const int i = (x / 3) * 6 + x % 3;
            out[x] = static_cast<unsigned char>((a[i] + a[i + 3] + b[i] + b[i + 3] + 2) / 4);
        }
    }
    return half;
}

void Paste(const CImage& src, CImage& dst, int left, int top) {
    for (int y = 0; y < src.GetHeight(); ++y)
        std::copy_n(src.GetPtrXY(0, y), 3 * src.GetWidth(), dst.GetPtrXY(left, top + y));
}

// shots (2 x 2 grid at half size) | result | truth
CImage Montage(const scene::Scene& s, const CImage& result) {
    const int w = s.truth.GetWidth(), h = s.truth.GetHeight(), gap = 8;
    CImage m(3 * w + 2 * gap, h, 24);
    m.Set(255);
    const int half[4][2] = {{0, 0}, {0, 1}, {1, 0}, {1, 1}};  // top, bottom above each other; left, right beside
    for (int k = 0; k < 4; ++k) {
        const CImage small = HalfSize(s.shots[k]);
        Paste(small, m, half[k][0] * (w - small.GetWidth()), half[k][1] * (h - small.GetHeight()));
    }
    Paste(result, m, w + gap, 0);
    Paste(s.truth, m, 2 * (w + gap), 0);
    return m;
}

// The output directory, created when missing; a bad one is the user's error (exit 2).
void MakeOutputDirectory(const std::string& path) {
    std::error_code error;
    std::filesystem::create_directories(path, error);
    if (error || !std::filesystem::is_directory(path))
        throw ToolError("--out " + path + ": cannot be used as a directory" +
                        (error ? " (" + error.message() + ")" : std::string(" (it is a file)")));
}

void RunDemo(const DemoArgs& args) {
    int w = 0, h = 0;
    ParseSize(args.size, w, h);
    MakeOutputDirectory(args.outDir);
    const std::string dir = args.outDir + "/";

    CStopWatch watch;
    const scene::Scene s = scene::GenerateScene({w, h, args.seed});
    std::printf("Generated an identity card of %d x %d (seed %u) under four lights in %.0f ms.\n", w, h, args.seed,
                watch.ElapsedMicro() / 1000.0);
    static const char* const shotNames[4] = {"top", "bottom", "left", "right"};
    std::printf("Glare pixels (glaring in some shot): %d\n", scene::Evaluate(s, s.truth).glarePixels);
    for (int k = 0; k < 4; ++k) {
        SaveImage(s.shots[k], dir + "shot_" + shotNames[k] + ".png");
        const scene::Quality q = scene::Evaluate(s, s.shots[k]);
        std::printf("  shot lit from the %-6s  PSNR %5.2f dB, still glaring %5.1f %%\n", shotNames[k], q.psnr,
                    100.0 * q.glareRemaining);
    }
    SaveImage(s.truth, dir + "truth.png");

    const CImage* const shots[4] = {&s.shots[0], &s.shots[1], &s.shots[2], &s.shots[3]};
    std::vector<scene::Outcome> outcomes;
    for (const FourImageMethod& method : FourImageMethods()) {
        CHologramsRemove remover;
        scene::Outcome o{method.name, 0.0, {}, CImage()};
        watch.Start();
        method.run(remover, shots, o.result);
        o.ms = watch.ElapsedMicro() / 1000.0;
        o.quality = scene::Evaluate(s, o.result);
        SaveImage(o.result, dir + "result_" + o.name + ".png");
        outcomes.push_back(std::move(o));
    }
    // Best first: higher PSNR, then less glare left.
    std::sort(outcomes.begin(), outcomes.end(), [](const scene::Outcome& a, const scene::Outcome& b) {
        if (a.quality.psnr != b.quality.psnr) return a.quality.psnr > b.quality.psnr;
        return a.quality.glareRemaining < b.quality.glareRemaining;
    });
    scene::PrintRanking("Four-image glare removal, best first:", outcomes);
    const std::string montage = dir + "montage.png";
    SaveImage(Montage(s, outcomes.front().result), montage);
    std::printf("\nWrote the shots, the truth and every result to %s\n", args.outDir.c_str());
    std::printf("%s: the four shots | the best result (%s) | the truth\n", montage.c_str(),
                outcomes.front().name.c_str());

    RunTwoImageDemo(dir, w, h, args.seed);
}

}  // namespace

void RegisterDemoCommand(CLI::App& app) {
    auto args = std::make_shared<DemoArgs>();
    CLI::App* cmd = app.add_subcommand(
        "demo", "Remove the glare from a generated identity card shot under four lights, with every method");
    cmd->add_option("--out", args->outDir, "Directory for the pictures (default ./varnoth-demo)");
    cmd->add_option("--size", args->size, "Card picture size WIDTHxHEIGHT (default 1240x1754)");
    cmd->add_option("--seed", args->seed, "Seed of the generated card (default 1)");
    cmd->callback([args] { RunDemo(*args); });
}
