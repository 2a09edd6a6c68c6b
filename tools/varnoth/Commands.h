#pragma once

#include <CLI/CLI.hpp>

// Each family of subcommands registers itself on the tool's app.
void RegisterFrameCommands(CLI::App& app);     // add, subtract, stretch, insert
void RegisterPyramidCommands(CLI::App& app);   // fuse, stitch
void RegisterHologramCommands(CLI::App& app);  // holo4, holo2, edges
void RegisterDemoCommand(CLI::App& app);       // demo
void RegisterChannelCommands(CLI::App& app);   // ir, match-channels
void RegisterGeometryCommands(CLI::App& app);  // warp, seam, hills
void RegisterCodingCommands(CLI::App& app);    // correlate, huffman
