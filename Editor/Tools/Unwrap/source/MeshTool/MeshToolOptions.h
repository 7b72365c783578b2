#pragma once
// The command line of chartbake-mesh: options with their ranges, the help text and the version.

#include "Editor/Tools/Unwrap/source/CLTool/LibraryExports.h"

#include <string>
#include <vector>

#define CHARTBAKE_MESH_VERSION "1.0.0"

struct MeshToolOptions
{
    UnwrapParam param{};           // starts from the unwrapper's defaults
    int resolution = 1024;         // texels a side of the atlas (layout picture, padding unit)
    bool perMesh = false;          // one atlas per mesh instead of one for the scene
    bool quiet = false;
    std::string layoutPath;        // --layout FILE.png, or empty
    std::string inputPath;
    std::string outputPath;
};

// What the command line asks for: run, print help or version (exit 0), or stop with `error`.
struct ParsedCommandLine
{
    enum Action { kRun, kHelp, kVersion, kError } action = kRun;
    MeshToolOptions options;
    std::string error;             // one sentence naming the option and what it accepts
};

ParsedCommandLine ParseMeshToolCommandLine(const std::vector<std::string>& args);
std::string MeshToolHelpText();
