// holo4: glare-free composites from four directionally lit shots.
#include <cstdio>
#include <memory>

#include "imagelib/StopWatch.h"
#include "varnoth/Commands.h"
#include "varnoth/FourImageMethods.h"
#include "varnoth/ToolIO.h"

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
            throw ToolError("the shots are too small for a seven-level pyramid (at least 65 x 65 pixels)");
        SaveImage(result, args->out);
        std::printf("holo4 %s: %d x %d in %.1f ms -> %s\n", method->name, result.GetWidth(), result.GetHeight(), ms,
                    args->out.c_str());
    });
}

}  // namespace

void RegisterHologramCommands(CLI::App& app) { AddHolo4Command(app); }
