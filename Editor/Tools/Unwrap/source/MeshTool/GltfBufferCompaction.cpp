#include "Editor/Tools/Unwrap/source/MeshTool/GltfBufferCompaction.h"

namespace
{
    void Mark(std::vector<int>* newIndex, int view)
    {
        if (view >= 0 && (size_t)view < newIndex->size())
            (*newIndex)[(size_t)view] = 0;
    }

    void Renumber(const std::vector<int>& newIndex, int* view)
    {
        if (*view >= 0 && (size_t)*view < newIndex.size())
            *view = newIndex[(size_t)*view];
    }
}

std::string GatherIntoOneBuffer(tinygltf::Model* model)
{
    // -1: unused; otherwise the view's number in the gathered list.
    std::vector<int> newIndex(model->bufferViews.size(), -1);
    for (const tinygltf::Accessor& accessor : model->accessors)
    {
        Mark(&newIndex, accessor.bufferView);
        if (accessor.sparse.isSparse)
            Mark(&newIndex, accessor.sparse.indices.bufferView), Mark(&newIndex, accessor.sparse.values.bufferView);
    }
    for (const tinygltf::Image& image : model->images)
        Mark(&newIndex, image.bufferView);

    tinygltf::Buffer gathered;
    if (!model->buffers.empty())
        gathered.name = model->buffers[0].name;
    std::vector<tinygltf::BufferView> views;
    for (size_t i = 0; i < model->bufferViews.size(); ++i)
    {
        if (newIndex[i] < 0)
            continue;
        tinygltf::BufferView view = model->bufferViews[i];
        if (view.buffer < 0 || (size_t)view.buffer >= model->buffers.size() ||
            view.byteOffset > model->buffers[(size_t)view.buffer].data.size() ||
            view.byteLength > model->buffers[(size_t)view.buffer].data.size() - view.byteOffset)
            return "buffer view " + std::to_string(i) + " reaches past the end of its buffer";
        const std::vector<unsigned char>& source = model->buffers[(size_t)view.buffer].data;
        gathered.data.resize((gathered.data.size() + 3) / 4 * 4, 0);
        size_t offset = gathered.data.size();
        gathered.data.insert(gathered.data.end(), source.begin() + (long)view.byteOffset,
                             source.begin() + (long)(view.byteOffset + view.byteLength));
        view.buffer = 0;
        view.byteOffset = offset;
        newIndex[i] = (int)views.size();
        views.push_back(view);
    }
    for (tinygltf::Accessor& accessor : model->accessors)
    {
        Renumber(newIndex, &accessor.bufferView);
        if (accessor.sparse.isSparse)
            Renumber(newIndex, &accessor.sparse.indices.bufferView), Renumber(newIndex, &accessor.sparse.values.bufferView);
    }
    for (tinygltf::Image& image : model->images)
        Renumber(newIndex, &image.bufferView);
    model->bufferViews = std::move(views);
    model->buffers.clear();
    if (!gathered.data.empty())
        model->buffers.push_back(std::move(gathered));
    return "";
}
