#include "Editor/Tools/Unwrap/source/MeshTool/GltfAccessors.h"

#include <algorithm>
#include <cstring>

namespace
{
    std::string AccessorError(int index, const std::string& what)
    {
        return "accessor " + std::to_string(index) + " " + what;
    }

    // Copies `count` elements of `elementSize` bytes from `view`, starting at `offset`, to `out`.
    std::string CopyFromView(const tinygltf::Model& model, int viewIndex, size_t offset, size_t count, size_t elementSize,
                             uint8_t* out)
    {
        if (viewIndex < 0 || (size_t)viewIndex >= model.bufferViews.size())
            return "names a missing buffer view";
        const tinygltf::BufferView& view = model.bufferViews[(size_t)viewIndex];
        if (view.buffer < 0 || (size_t)view.buffer >= model.buffers.size())
            return "uses a buffer view with a missing buffer";
        const std::vector<unsigned char>& buffer = model.buffers[(size_t)view.buffer].data;
        size_t stride = view.byteStride ? view.byteStride : elementSize;
        if (count == 0)
            return "";
        size_t last = offset + (count - 1) * stride + elementSize;
        if (view.byteOffset > buffer.size() || view.byteLength > buffer.size() - view.byteOffset || last > view.byteLength)
            return "reaches past the end of its buffer";
        const uint8_t* base = buffer.data() + view.byteOffset + offset;
        for (size_t i = 0; i < count; ++i)
            std::memcpy(out + i * elementSize, base + i * stride, elementSize);
        return "";
    }

    std::string ApplySparse(const tinygltf::Model& model, const tinygltf::Accessor& accessor, DenseAccessor* out)
    {
        const auto& sparse = accessor.sparse;
        size_t count = (size_t)sparse.count;
        int indexSize = tinygltf::GetComponentSizeInBytes((uint32_t)sparse.indices.componentType);
        if (indexSize <= 0)
            return "has sparse indices of an unknown component type";
        std::vector<uint8_t> indices(count * (size_t)indexSize), values(count * out->elementSize);
        std::string error = CopyFromView(model, sparse.indices.bufferView, (size_t)sparse.indices.byteOffset, count,
                                         (size_t)indexSize, indices.data());
        if (error.empty())
            error = CopyFromView(model, sparse.values.bufferView, (size_t)sparse.values.byteOffset, count,
                                 out->elementSize, values.data());
        if (!error.empty())
            return "(sparse) " + error;
        for (size_t i = 0; i < count; ++i)
        {
            uint32_t target = 0;
            if (indexSize == 1)
                target = indices[i];
            else if (indexSize == 2)
                target = (uint32_t)(indices[2 * i] | indices[2 * i + 1] << 8);
            else
                std::memcpy(&target, &indices[4 * i], 4);
            if (target >= out->count)
                return "has a sparse index past its count";
            std::memcpy(&out->bytes[target * out->elementSize], &values[i * out->elementSize], out->elementSize);
        }
        return "";
    }

    double Component(int componentType, bool normalized, const uint8_t* p)
    {
        switch (componentType)
        {
            case TINYGLTF_COMPONENT_TYPE_FLOAT: { float f; std::memcpy(&f, p, 4); return f; }
            case TINYGLTF_COMPONENT_TYPE_BYTE: { double v = (int8_t)*p; return normalized ? std::max(v / 127.0, -1.0) : v; }
            case TINYGLTF_COMPONENT_TYPE_UNSIGNED_BYTE: return normalized ? *p / 255.0 : *p;
            case TINYGLTF_COMPONENT_TYPE_SHORT:
            {
                int16_t s; std::memcpy(&s, p, 2);
                return normalized ? std::max(s / 32767.0, -1.0) : s;
            }
            case TINYGLTF_COMPONENT_TYPE_UNSIGNED_SHORT: { uint16_t s; std::memcpy(&s, p, 2); return normalized ? s / 65535.0 : s; }
            case TINYGLTF_COMPONENT_TYPE_UNSIGNED_INT: { uint32_t u; std::memcpy(&u, p, 4); return u; }
            default: return 0;
        }
    }

    size_t AlignUp(size_t value, size_t alignment) { return (value + alignment - 1) / alignment * alignment; }
}

std::string ReadDenseAccessor(const tinygltf::Model& model, int accessorIndex, DenseAccessor* out)
{
    if (accessorIndex < 0 || (size_t)accessorIndex >= model.accessors.size())
        return AccessorError(accessorIndex, "does not exist");
    const tinygltf::Accessor& accessor = model.accessors[(size_t)accessorIndex];
    int componentSize = tinygltf::GetComponentSizeInBytes((uint32_t)accessor.componentType);
    int components = tinygltf::GetNumComponentsInType((uint32_t)accessor.type);
    if (componentSize <= 0 || components <= 0)
        return AccessorError(accessorIndex, "has an unknown type");
    out->count = accessor.count;
    out->elementSize = (size_t)componentSize * (size_t)components;
    // An accessor without a buffer view is zeros (plus sparse values) and costs nothing in the
    // file; its dense copy is bounded by the file's data so that a forged count cannot ask for
    // more memory than the file could plausibly need.
    size_t dataBytes = 0;
    for (const tinygltf::Buffer& buffer : model.buffers)
        dataBytes += buffer.data.size();
    size_t limit = 4 * dataBytes + ((size_t)64 << 20);
    if (out->count > (size_t)1 << 31 || out->count * out->elementSize > limit)
        return AccessorError(accessorIndex, "claims " + std::to_string(out->count) +
                                                " elements, more than the file's data could hold");
    out->bytes.assign(out->count * out->elementSize, 0);
    std::string error;
    if (accessor.bufferView >= 0)
        error = CopyFromView(model, accessor.bufferView, accessor.byteOffset, out->count, out->elementSize, out->bytes.data());
    if (error.empty() && accessor.sparse.isSparse)
        error = ApplySparse(model, accessor, out);
    return error.empty() ? "" : AccessorError(accessorIndex, error);
}

std::vector<double> DecodeComponents(const tinygltf::Accessor& accessor, const DenseAccessor& dense)
{
    int componentSize = tinygltf::GetComponentSizeInBytes((uint32_t)accessor.componentType);
    size_t total = componentSize > 0 ? dense.bytes.size() / (size_t)componentSize : 0;
    std::vector<double> values(total);
    for (size_t i = 0; i < total; ++i)
        values[i] = Component(accessor.componentType, accessor.normalized, &dense.bytes[i * (size_t)componentSize]);
    return values;
}

uint32_t IndexAt(const tinygltf::Accessor& accessor, const DenseAccessor& dense, size_t i)
{
    return (uint32_t)Component(accessor.componentType, false, &dense.bytes[i * dense.elementSize]);
}

tinygltf::Accessor AppendAccessorData(tinygltf::Model* model, int bufferIndex, const tinygltf::Accessor& like,
                                      const DenseAccessor& dense, int bufferViewTarget, bool withBounds)
{
    std::vector<unsigned char>& buffer = model->buffers[(size_t)bufferIndex].data;
    bool attribute = bufferViewTarget == TINYGLTF_TARGET_ARRAY_BUFFER;
    size_t stride = attribute ? AlignUp(dense.elementSize, 4) : dense.elementSize;
    buffer.resize(AlignUp(buffer.size(), 4), 0);

    tinygltf::BufferView view;
    view.buffer = bufferIndex;
    view.byteOffset = buffer.size();
    view.byteLength = dense.count ? (dense.count - 1) * stride + dense.elementSize : 0;
    view.byteStride = stride != dense.elementSize ? stride : 0;
    view.target = bufferViewTarget;
    buffer.resize(buffer.size() + view.byteLength, 0);
    for (size_t i = 0; i < dense.count; ++i)
        std::memcpy(&buffer[view.byteOffset + i * stride], &dense.bytes[i * dense.elementSize], dense.elementSize);
    model->bufferViews.push_back(view);

    tinygltf::Accessor accessor;
    accessor.name = like.name;
    accessor.extras = like.extras;
    accessor.type = like.type;
    accessor.componentType = like.componentType;
    accessor.normalized = like.normalized;
    accessor.count = dense.count;
    accessor.bufferView = (int)model->bufferViews.size() - 1;
    accessor.byteOffset = 0;
    if (withBounds && dense.count > 0)
    {
        std::vector<double> values = DecodeComponents(accessor, dense);
        size_t components = values.size() / dense.count;
        accessor.minValues.assign(values.begin(), values.begin() + (long)components);
        accessor.maxValues = accessor.minValues;
        for (size_t i = 0; i < values.size(); ++i)
        {
            accessor.minValues[i % components] = std::min(accessor.minValues[i % components], values[i]);
            accessor.maxValues[i % components] = std::max(accessor.maxValues[i % components], values[i]);
        }
    }
    return accessor;
}
