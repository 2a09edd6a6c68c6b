// varnoth: the command-line face of the library.
#include <cstdio>
#include <cstdlib>
#include <string>

#include "imagelib/Parallel.h"
#include "varnoth/Commands.h"
#include "varnoth/ToolIO.h"

namespace {

const char* kDescription =
    "varnoth - image processing for multi-shot document scans.\n"
    "Services: glare-free composites from four directionally lit shots (holo4), glare\n"
    "detection and repair from two shots (holo2, edges), Laplacian-pyramid fusion (fuse,\n"
    "stitch), a synthetic infrared image and colour-plane alignment (ir, match-channels),\n"
    "affine and radial warps, seam straightening and a three-level threshold (warp, seam,\n"
    "hills), correlation and Huffman tables (correlate, huffman), whole-image arithmetic\n"
    "(add, subtract, stretch, insert), and a demo on a generated document (demo).";

}  // namespace

int main(int argc, char** argv) {
    CLI::App app(kDescription, "varnoth");
    app.set_version_flag("--version", std::string("varnoth ") + VARNOTH_VERSION);
    app.require_subcommand(1);

    int threads = 0;
    bool trace = false;
    std::string dumpDir;
    app.add_option("--threads", threads, "Worker threads for parallel operations (0 = all cores)")
        ->check(CLI::NonNegativeNumber);
    app.add_flag("--trace", trace, "Print the library's trace lines to standard error");
    app.add_option("--dump-dir", dumpDir, "Write the library's debug pictures under this directory");
    app.parse_complete_callback([&] {
        imagelib::SetThreadLimit(threads);
        if (trace) setenv("VARNOTH_TRACE", "1", 1);
        if (!dumpDir.empty()) setenv("VARNOTH_DUMP_DIR", dumpDir.c_str(), 1);
    });

    RegisterFrameCommands(app);
    RegisterPyramidCommands(app);
    RegisterHologramCommands(app);
    RegisterChannelCommands(app);
    RegisterGeometryCommands(app);
    RegisterCodingCommands(app);
    RegisterDemoCommand(app);

    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& e) {
        const int rc = app.exit(e);
        return rc == 0 ? 0 : 2;
    } catch (const ToolError& e) {
        std::fprintf(stderr, "varnoth: error: %s\n", e.what());
        return 2;
    } catch (const std::exception& e) {
        std::fprintf(stderr, "varnoth: error: %s\n", e.what());
        return 1;
    }
    return 0;
}
