#include "Containers.h"

bool BlobArray::Add(const void* blob, uint32_t length)
{
    uint32_t start = bytes.size;
    if (!offsets.Push(start) || !bytes.Reserve(start + 4 + length + 64))
        return false;
    memcpy(bytes.data + start, &length, 4);
    memcpy(bytes.data + start + 4, blob, length);
    bytes.size = start + 4 + length;
    return true;
}

const uint8_t* BlobArray::Get(uint32_t i, uint32_t* length) const
{
    const uint8_t* record = bytes.data + offsets.data[i];
    memcpy(length, record, 4);
    return record + 4;
}

namespace
{
    uint32_t Slot(uint32_t key, uint32_t capacity) { return (key * 2654435761u) & (capacity - 1); }
}

bool HashTab::Set(uint32_t key, uint32_t value)
{
    if ((count + 1) * 2 > capacity)
    {
        HashTab grown;
        grown.capacity = capacity ? capacity * 2 : 16;
        grown.keys = (uint32_t*)Tessary_Allocate(grown.capacity * 4);
        grown.values = (uint32_t*)Tessary_Allocate(grown.capacity * 4);
        if (!grown.keys || !grown.values)
            return false;
        memset(grown.keys, 0xFF, grown.capacity * 4);
        for (uint32_t i = 0; i < capacity; ++i)
            if (keys[i] != kEmpty)
                grown.Set(keys[i], values[i]);
        Release();
        *this = grown;
    }
    uint32_t slot = Slot(key, capacity);
    while (keys[slot] != kEmpty && keys[slot] != key)
        slot = (slot + 1) & (capacity - 1);
    if (keys[slot] == kEmpty)
        ++count;
    keys[slot] = key;
    values[slot] = value;
    return true;
}

bool HashTab::Get(uint32_t key, uint32_t* value) const
{
    if (!capacity)
        return false;
    for (uint32_t slot = Slot(key, capacity); keys[slot] != kEmpty; slot = (slot + 1) & (capacity - 1))
        if (keys[slot] == key)
        {
            *value = values[slot];
            return true;
        }
    return false;
}

void HashTab::Release()
{
    Tessary_Deallocate(keys);
    Tessary_Deallocate(values);
    keys = values = nullptr;
    capacity = count = 0;
}

bool PriorityQueue::Push(float priority, uint32_t item)
{
    if (!heap.Push(Entry{priority, item}))
        return false;
    for (uint32_t i = heap.size - 1; i > 0 && heap[(i - 1) / 2].priority > heap[i].priority; i = (i - 1) / 2)
    {
        Entry parent = heap[(i - 1) / 2];
        heap[(i - 1) / 2] = heap[i];
        heap[i] = parent;
    }
    return true;
}

bool PriorityQueue::Pop(Entry* top)
{
    if (!heap.size)
        return false;
    *top = heap[0];
    heap[0] = heap[--heap.size];
    for (uint32_t i = 0;;)
    {
        uint32_t smallest = i, l = 2 * i + 1, r = 2 * i + 2;
        if (l < heap.size && heap[l].priority < heap[smallest].priority) smallest = l;
        if (r < heap.size && heap[r].priority < heap[smallest].priority) smallest = r;
        if (smallest == i)
            return true;
        Entry t = heap[i];
        heap[i] = heap[smallest];
        heap[smallest] = t;
        i = smallest;
    }
}
