// demo: a generated picture through the arithmetic and the stretch.
#include <cstdio>
#include <filesystem>

#include "frame/ImageArithmetic.h"
#include "varnoth/Commands.h"
#include "varnoth/ToolIO.h"

void RegisterDemoCommand(CLI::App& app) {
    auto outDir = std::make_shared<std::string>("varnoth-demo");
    CLI::App* cmd = app.add_subcommand("demo", "Run the library on a generated picture and write the results");
    cmd->add_option("--out", *outDir, "Directory for the pictures (default ./varnoth-demo)");
    cmd->callback([outDir] {
        std::filesystem::create_directories(*outDir);
        CImage low(640, 480, 24), high(640, 480, 24);
        for (int y = 0; y < 480; ++y)
            for (int x = 0; x < 640; ++x) {
                unsigned char* p = low.GetPtrXY(x, y);
                p[0] = static_cast<unsigned char>(96 + (x * 64) / 640);
                p[1] = static_cast<unsigned char>(96 + (y * 64) / 480);
                p[2] = static_cast<unsigned char>(((x / 40 + y / 40) % 2) ? 150 : 110);
                high.GetPtrXY(x, y)[1] = static_cast<unsigned char>((x * y) % 97);
            }
        CImage sum, stretched;
        ImageAdd(low, high, sum);
        stretched = sum;
        ImageStretch(stretched);
        const std::string path = *outDir + "/stretched.png";
        SaveImage(stretched, path);
        std::printf("wrote %s\n", path.c_str());
    });
}
