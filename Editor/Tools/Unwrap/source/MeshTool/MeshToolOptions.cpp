#include "Editor/Tools/Unwrap/source/MeshTool/MeshToolOptions.h"

#include "Editor/Tools/Unwrap/source/CLTool/MeshFiles.h"

#include <cerrno>
#include <cmath>
#include <cstdlib>

namespace
{
    // One numeric option: its name, the closed or half-open range it accepts, and its unit.
    struct Range
    {
        double min, max;
        bool minOpen, maxOpen;
        const char* text;   // the range as the error and the help state it
    };

    const Range kAngleRange = {0, 180, true, false, "greater than 0 and at most 180 (degrees)"};
    const Range kDistortionRange = {0, 1, false, false, "from 0 to 1"};
    const Range kMarginRange = {0, 0.25, false, true, "from 0 to less than 0.25 (fraction of the atlas side)"};
    const Range kResolutionRange = {16, 16384, false, false, "an integer from 16 to 16384 (texels)"};
    const Range kPaddingRange = {0, 1e9, false, false, "an integer of 0 or more, under a quarter of the resolution (texels)"};

    bool InRange(double value, const Range& range)
    {
        if (!std::isfinite(value))
            return false;
        if (range.minOpen ? value <= range.min : value < range.min)
            return false;
        return range.maxOpen ? value < range.max : value <= range.max;
    }

    bool ParseNumber(const std::string& text, double* value)
    {
        if (text.empty())
            return false;
        errno = 0;
        char* end = nullptr;
        *value = std::strtod(text.c_str(), &end);
        return errno == 0 && end && *end == '\0';
    }

    struct Parser
    {
        const std::vector<std::string>& args;
        size_t next = 0;
        ParsedCommandLine result;

        bool Fail(const std::string& message)
        {
            result.action = ParsedCommandLine::kError;
            result.error = message;
            return false;
        }

        // Reads the value after `option` into `value`, checked against `range`.
        bool Number(const std::string& option, const Range& range, bool integer, double* value)
        {
            if (next >= args.size())
                return Fail(option + " needs a value: " + range.text);
            const std::string& text = args[next++];
            if (!ParseNumber(text, value) || !InRange(*value, range) || (integer && *value != std::floor(*value)))
                return Fail(option + " must be " + range.text + ", not '" + text + "'");
            return true;
        }
    };
}

ParsedCommandLine ParseMeshToolCommandLine(const std::vector<std::string>& args)
{
    Parser p{args, 0, {}};
    MeshToolOptions& o = p.result.options;
    o.param = DefaultUnwrapParam();
    bool marginGiven = false, paddingGiven = false;
    double padding = 0;
    std::vector<std::string> paths;
    while (p.next < args.size())
    {
        const std::string arg = args[p.next++];
        double value = 0;
        if (arg == "--help" || arg == "-h")
        {
            p.result.action = ParsedCommandLine::kHelp;
            return p.result;
        }
        if (arg == "--version")
        {
            p.result.action = ParsedCommandLine::kVersion;
            return p.result;
        }
        if (arg == "--hard-angle")
        {
            if (!p.Number(arg, kAngleRange, false, &value))
                return p.result;
            o.param.hardAngle = (float)value;
        }
        else if (arg == "--angle-distortion" || arg == "--area-distortion")
        {
            if (!p.Number(arg, kDistortionRange, false, &value))
                return p.result;
            (arg == "--angle-distortion" ? o.param.angleDistortionThreshold : o.param.areaDistortionThreshold) =
                (float)value;
        }
        else if (arg == "--margin")
        {
            if (!p.Number(arg, kMarginRange, false, &value))
                return p.result;
            o.param.packMargin = (float)value;
            marginGiven = true;
        }
        else if (arg == "--resolution")
        {
            if (!p.Number(arg, kResolutionRange, true, &value))
                return p.result;
            o.resolution = (int)value;
        }
        else if (arg == "--padding")
        {
            if (!p.Number(arg, kPaddingRange, true, &padding))
                return p.result;
            paddingGiven = true;
        }
        else if (arg == "--weld")
            o.param.recollectVertices = 1;
        else if (arg == "--per-mesh")
            o.perMesh = true;
        else if (arg == "--quiet" || arg == "-q")
            o.quiet = true;
        else if (arg == "--layout")
        {
            if (p.next >= args.size())
                return p.Fail("--layout needs a file name ending in .png"), p.result;
            o.layoutPath = args[p.next++];
        }
        else if (arg.size() > 1 && arg[0] == '-' && arg != "--")
            return p.Fail("unknown option '" + arg + "' (see --help)"), p.result;
        else
            paths.push_back(arg);
    }
    if (marginGiven && paddingGiven)
        return p.Fail("--margin and --padding both set the margin: give one of them"), p.result;
    if (paddingGiven)
    {
        if (padding * 4 >= o.resolution)
            return p.Fail("--padding must be " + std::string(kPaddingRange.text) + " (" +
                          std::to_string(o.resolution / 4) + " at --resolution " + std::to_string(o.resolution) + ")"),
                   p.result;
        o.param.packMargin = (float)(padding / o.resolution);
    }
    if (!o.layoutPath.empty() && (o.layoutPath.size() < 4 || o.layoutPath.substr(o.layoutPath.size() - 4) != ".png"))
        return p.Fail("--layout needs a file name ending in .png, not '" + o.layoutPath + "'"), p.result;
    if (paths.size() != 2)
        return p.Fail(paths.size() < 2 ? "need an input and an output file (see --help)"
                                       : "too many file names: expected <input> <output> (see --help)"),
               p.result;
    o.inputPath = paths[0];
    o.outputPath = paths[1];
    return p.result;
}

std::string MeshToolHelpText()
{
    return
        "usage: chartbake-mesh [options] <input> <output>\n"
        "\n"
        "Adds lightmap UVs (a second UV set, every chart inside the unit square) to a mesh.\n"
        "\n"
        "Input:  .gltf .glb (glTF 2.0), .obj, .ply, .stl, .fbx\n"
        "Output: .gltf .glb  the input with TEXCOORD_1 added to every triangle primitive (or the first free\n"
        "                    TEXCOORD set); everything else is kept\n"
        "        .obj        positions, normals, groups and materials (a .mtl beside it); OBJ holds one UV\n"
        "                    set, so its vt lines are the lightmap UVs\n"
        "\n"
        "Options (defaults in brackets):\n"
        "  --hard-angle DEG        charts do not grow across edges sharper than this, degrees, >0 to 180 [88]\n"
        "  --angle-distortion X    allowed relative change of a triangle's corner angles when flattened,\n"
        "                          0 to 1 [0.08]\n"
        "  --area-distortion X     allowed relative loss of a triangle's area when flattened, 0 to 1 [0.15]\n"
        "  --margin FRACTION       space between charts and around the border, as a fraction of the atlas\n"
        "                          side, 0 to <0.25 [0.00390625 = 1/256]\n"
        "  --resolution N          lightmap size in texels, 16 to 16384 [1024]; sets the --layout picture size\n"
        "  --padding PIXELS        margin in texels of --resolution: margin = padding / resolution [4]\n"
        "  --weld                  treat vertices at the same position as one (for meshes split at normal or\n"
        "                          UV seams, and triangle soups such as STL) [off; on for .stl input]\n"
        "  --per-mesh              give every mesh its own atlas [all meshes share one atlas, one texel density]\n"
        "  --layout FILE.png       also draw the atlas: one colour per chart, chart outlines dark\n"
        "  --quiet                 print nothing on success\n"
        "  --version               print the version and exit\n"
        "  --help                  print this text and exit\n"
        "\n"
        "Exit status: 0 when the output was written, 1 on any error (nothing is written then).\n";
}
