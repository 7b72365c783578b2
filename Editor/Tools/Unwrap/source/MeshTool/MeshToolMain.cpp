// chartbake-mesh: lightmap UVs for the mesh files people have. Reads a glTF, OBJ, PLY, STL or FBX
// file, unwraps all of its triangles into one atlas (or one atlas a mesh) with Unwrap.dll, and
// writes the mesh with the lightmap UVs added (glTF: a new TEXCOORD set, everything else kept;
// OBJ: the vt lines).
//
// Stages: check the command line and the files -> read -> unwrap -> assemble the outputs in
// memory -> commit them all at once (temporary file beside each target, then rename).
#include "Editor/Tools/Unwrap/source/CLTool/UnwrapLibraries.h"
#include "Editor/Tools/Unwrap/source/MeshTool/Atlas.h"
#include "Editor/Tools/Unwrap/source/MeshTool/ChartStats.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshFileChecks.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshInput.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshOutput.h"
#include "Editor/Tools/Unwrap/source/MeshTool/MeshToolOptions.h"
#include "Editor/Tools/Unwrap/source/MeshTool/OutputFiles.h"
#include "Editor/Tools/Unwrap/source/MeshTool/Progress.h"
#include "Runtime/Logging/LogAssert.h"

#include <cstdio>
#include <exception>
#include <new>
#include <filesystem>

namespace
{
    int Fail(const std::string& message)
    {
        std::fprintf(stderr, "chartbake-mesh: %s\n", message.c_str());
        return 1;
    }

    int Run(MeshToolOptions options)
    {
        std::string error = CheckMeshFiles(options);
        if (!error.empty())
            return Fail(error);
        if (LowerExtension(options.inputPath) == ".stl")
            options.param.recollectVertices = 1;   // STL is a triangle soup: welding is the only way to see edges

        Progress progress(!options.quiet);
        progress.Stage("reading");
        MeshInput input;
        error = ReadMeshInput(options.inputPath, &input);
        if (!error.empty())
            return Fail(error);

        progress.Stage("unwrapping");
        LoadUnwrapLibraries();
        error = DescribeMissingForUnwrap();
        if (!error.empty())
            return Fail("cannot unwrap: " + error);
        AtlasResult atlas;
        error = UnwrapScene(input.scene, options.param, options.perMesh, &atlas);
        if (!atlas.libraryMessage.empty() && !options.quiet)
            std::fprintf(stderr, "chartbake-mesh: unwrapper: %s\n", atlas.libraryMessage.c_str());
        if (!error.empty())
            return Fail(error);
        ChartStats charts = ComputeChartStats(input.scene, atlas.uvs, atlas.atlasCount);

        progress.Stage("writing");
        PendingOutputs outputs;
        error = AssembleMeshOutputs(options, &input, atlas, charts, &outputs);
        if (error.empty())
            error = outputs.Commit();
        if (!error.empty())
            return Fail(error);

        if (!options.quiet)
            std::printf("chartbake-mesh: wrote %s: %llu triangle%s, %u chart%s, %.1f%% of the atlas used, %.2f s\n",
                        options.outputPath.c_str(), (unsigned long long)input.scene.TriangleCount(),
                        input.scene.TriangleCount() == 1 ? "" : "s", charts.chartCount, charts.chartCount == 1 ? "" : "s",
                        charts.utilization * 100, progress.Seconds());
        return 0;
    }
}

int main(int argc, char** argv)
{
    InitializeLoggingFromEnvironment();
    ParsedCommandLine command = ParseMeshToolCommandLine(std::vector<std::string>(argv + 1, argv + argc));
    switch (command.action)
    {
        case ParsedCommandLine::kHelp:
            std::fputs(MeshToolHelpText().c_str(), stdout);
            return 0;
        case ParsedCommandLine::kVersion:
            std::puts("chartbake-mesh " CHARTBAKE_MESH_VERSION);
            return 0;
        case ParsedCommandLine::kError:
            return Fail(command.error);
        case ParsedCommandLine::kRun:
            break;
    }
    // Hardening: a file that asks for more memory than there is, or trips a library, still ends
    // with a message and status 1 (and, outputs being committed last, without an output).
    try
    {
        return Run(command.options);
    }
    catch (const std::bad_alloc&)
    {
        return Fail("out of memory reading " + command.options.inputPath);
    }
    catch (const std::exception& e)
    {
        return Fail(std::string("failed: ") + e.what());
    }
}
