#include "Editor/Tools/Unwrap/source/MeshTool/MeshFileChecks.h"

#include "Editor/Tools/Unwrap/source/MeshTool/OutputFiles.h"

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>

namespace fs = std::filesystem;

namespace
{
    const char* const kInputFormats = ".gltf, .glb, .obj, .ply, .stl or .fbx";
    const char* const kOutputFormats = ".gltf, .glb or .obj";

    bool OneOf(const std::string& ext, std::initializer_list<const char*> list)
    {
        for (const char* item : list)
            if (ext == item)
                return true;
        return false;
    }

    // Same file, or the same name once both are made absolute (for files that do not exist yet).
    bool SamePlace(const std::string& a, const std::string& b)
    {
        std::error_code ec1, ec2;
        return IsSameFile(a, b) || fs::weakly_canonical(a, ec1) == fs::weakly_canonical(b, ec2);
    }
}

std::string MaterialLibraryPath(const std::string& objPath)
{
    return (fs::path(objPath).parent_path() / (fs::path(objPath).stem().string() + ".mtl")).string();
}

std::string CheckMeshFiles(const MeshToolOptions& options)
{
    const std::string& in = options.inputPath;
    const std::string& out = options.outputPath;
    std::string inExt = LowerExtension(in), outExt = LowerExtension(out);
    if (!OneOf(inExt, {".gltf", ".glb", ".obj", ".ply", ".stl", ".fbx"}))
        return "unsupported input format '" + inExt + "' of " + in + " (use " + kInputFormats + ")";
    if (!OneOf(outExt, {".gltf", ".glb", ".obj"}))
        return "unsupported output format '" + outExt + "' of " + out + " (use " + kOutputFormats + ")";

    std::error_code ec;
    if (fs::is_directory(in, ec))
        return "cannot read " + in + ": it is a directory";
    FILE* file = std::fopen(in.c_str(), "rb");
    if (!file)
        return "cannot read " + in + ": " + std::strerror(errno);
    bool empty = std::fgetc(file) == EOF;
    std::fclose(file);
    if (empty)
        return in + " is empty";

    std::vector<std::string> outputs = {out};
    if (outExt == ".obj")
        outputs.push_back(MaterialLibraryPath(out));
    if (!options.layoutPath.empty())
        outputs.push_back(options.layoutPath);
    for (size_t i = 0; i < outputs.size(); ++i)
    {
        if (SamePlace(in, outputs[i]))
            return "the output " + outputs[i] + " is the input file; choose another output name";
        for (size_t j = 0; j < i; ++j)
            if (SamePlace(outputs[i], outputs[j]))
                return "two outputs would be the same file: " + outputs[i];
        if (fs::is_directory(outputs[i], ec))
            return "cannot write " + outputs[i] + ": it is a directory";
    }
    return "";
}
