#include "Editor/Tools/Unwrap/source/MeshTool/GltfDocument.h"

#include "Editor/Tools/Unwrap/source/MeshTool/OutputFiles.h"

#include <filesystem>
#include <sstream>

namespace fs = std::filesystem;

namespace
{
    // Keeps the encoded image as it is: the output refers to, or embeds, the same bytes.
    bool KeepEncodedImage(tinygltf::Image* image, const int, std::string*, std::string*, int, int,
                          const unsigned char* bytes, int size, void*)
    {
        image->image.assign(bytes, bytes + size);
        image->as_is = true;
        return true;
    }

    struct ImageTarget
    {
        std::string sourceDirectory;
        std::string outputDirectory;
    };

    std::string Base64(const std::vector<unsigned char>& bytes)
    {
        static const char* const kDigits = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";
        std::string text;
        text.reserve((bytes.size() + 2) / 3 * 4);
        for (size_t i = 0; i < bytes.size(); i += 3)
        {
            uint32_t group = (uint32_t)bytes[i] << 16;
            if (i + 1 < bytes.size())
                group |= (uint32_t)bytes[i + 1] << 8;
            if (i + 2 < bytes.size())
                group |= bytes[i + 2];
            text += kDigits[(group >> 18) & 63];
            text += kDigits[(group >> 12) & 63];
            text += i + 1 < bytes.size() ? kDigits[(group >> 6) & 63] : '=';
            text += i + 2 < bytes.size() ? kDigits[group & 63] : '=';
        }
        return text;
    }

    // An image that was a file stays that file (named relative to the output); one that was
    // embedded as a data URI is embedded again, byte for byte.
    bool PlaceImage(const std::string*, const std::string*, const tinygltf::Image* image, bool, std::string* outUri,
                    void* user)
    {
        const ImageTarget& target = *static_cast<const ImageTarget*>(user);
        if (!image->uri.empty())
        {
            *outUri = RelinkPath(image->uri, target.sourceDirectory, target.outputDirectory);
            return true;
        }
        *outUri = "data:" + (image->mimeType.empty() ? std::string("image/png") : image->mimeType) + ";base64," +
                  Base64(image->image);
        return true;
    }
}

std::string LoadGltf(const std::string& path, GltfDocument* document)
{
    tinygltf::TinyGLTF loader;
    loader.SetImageLoader(KeepEncodedImage, nullptr);
    std::string error, warning;
    bool binary = LowerExtension(path) == ".glb";
    bool ok = binary ? loader.LoadBinaryFromFile(&document->model, &error, &warning, path)
                     : loader.LoadASCIIFromFile(&document->model, &error, &warning, path);
    if (!ok)
    {
        while (!error.empty() && (error.back() == '\n' || error.back() == ' '))
            error.pop_back();
        return error.empty() ? "not a valid glTF 2.0 file" : error;
    }
    document->directory = fs::path(path).parent_path().string();
    return "";
}

std::string SerializeGltf(const GltfDocument& document, const std::string& outputPath, std::string* bytes)
{
    ImageTarget target{document.directory, fs::path(outputPath).parent_path().string()};
    tinygltf::TinyGLTF writer;
    writer.SetImageWriter(PlaceImage, &target);
    std::ostringstream stream;
    bool binary = LowerExtension(outputPath) == ".glb";
    if (!writer.WriteGltfSceneToStream(&document.model, stream, /*prettyPrint*/ !binary, binary))
        return "cannot encode the glTF output";
    *bytes = stream.str();
    return "";
}
