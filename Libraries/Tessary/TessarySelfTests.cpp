// Tessary.dll's self-test exports: each runs genuine checks of the library's own code and answers
// true when all hold. CHARTBAKE_LIBRARY_BEHAVIOUR may turn any of them into a failure or a crash.
#include "LibraryBehaviour.h"
#include "MeshOps.h"

#define TESSARY_TEST(name) \
    static bool name##Checks(); \
    TESSARY_API bool Tessary_##name() { return TestExportResult("Tessary_" #name, name##Checks()); } \
    static bool name##Checks()

namespace
{
    bool Near(double a, double b, double tolerance = 1e-5) { return fabs(a - b) <= tolerance; }

    // Two triangles sharing the edge 1-2 (a unit square split on its diagonal), a sliver with a
    // repeated corner, and a separate triangle far away.
    const float kPositions[] = {0, 0, 0, 1, 0, 0, 0, 1, 0, 1, 1, 0, 5, 5, 5, 6, 5, 5, 5, 6, 5};
    const uint32_t kIndices[] = {0, 1, 2, 2, 1, 3, 0, 0, 3, 4, 5, 6};

    bool MakeSample(Tessary_MeshDesc* mesh) { return MakeMesh(mesh, kPositions, 7, kIndices, 4); }
}

TESSARY_TEST(TestMathBasic)
{
    return sqrt(16.0) == 4.0 && floor(-1.5) == -2.0 && ceil(1.25) == 2.0 && fabs(-3.0) == 3.0 &&
           Near(pow(2.0, 10.0), 1024.0) && Near(fmod(7.5, 2.0), 1.5) && sqrtf(9.0f) == 3.0f;
}

TESSARY_TEST(TestTrigonometry)
{
    for (double x = -3.0; x <= 3.0; x += 0.25)
        if (!Near(sin(x) * sin(x) + cos(x) * cos(x), 1.0) || !Near(atan2(sin(x), cos(x)), x))
            return false;
    return Near(acos(0.0) * 2, 3.14159265358979) && Near(tan(0.5), sin(0.5) / cos(0.5));
}

TESSARY_TEST(TestLog)
{
    return Near(log(exp(2.5)), 2.5) && Near(exp(log(10.0)), 10.0) && Near(log(1.0), 0.0);
}

namespace
{
    // Inverts a 4x4 row-major matrix by Gauss-Jordan elimination with partial pivoting.
    bool Invert4(const double* m, double* inverse)
    {
        double a[4][8];
        for (int r = 0; r < 4; ++r)
            for (int c = 0; c < 8; ++c)
                a[r][c] = c < 4 ? m[4 * r + c] : (c - 4 == r ? 1.0 : 0.0);
        for (int col = 0; col < 4; ++col)
        {
            int pivot = col;
            for (int r = col + 1; r < 4; ++r)
                pivot = fabs(a[r][col]) > fabs(a[pivot][col]) ? r : pivot;
            if (fabs(a[pivot][col]) < 1e-12)
                return false;
            for (int c = 0; c < 8; ++c)
            {
                double t = a[col][c];
                a[col][c] = a[pivot][c];
                a[pivot][c] = t;
            }
            double scale = a[col][col];
            for (int c = 0; c < 8; ++c)
                a[col][c] /= scale;
            for (int r = 0; r < 4; ++r)
            {
                if (r == col)
                    continue;
                double factor = a[r][col];
                for (int c = 0; c < 8; ++c)
                    a[r][c] -= factor * a[col][c];
            }
        }
        for (int r = 0; r < 4; ++r)
            for (int c = 0; c < 4; ++c)
                inverse[4 * r + c] = a[r][c + 4];
        return true;
    }
}

TESSARY_TEST(TestMatrix4Invert)
{
    const double m[16] = {2, 0, 0, 1, 0, 3, 0, 2, 1, 0, 4, 0, 0, 0, 0, 1};
    double inverse[16];
    if (!Invert4(m, inverse))
        return false;
    for (int r = 0; r < 4; ++r)
        for (int c = 0; c < 4; ++c)
        {
            double sum = 0;
            for (int k = 0; k < 4; ++k)
                sum += m[4 * r + k] * inverse[4 * k + c];
            if (!Near(sum, r == c ? 1.0 : 0.0, 1e-9))
                return false;
        }
    const double singular[16] = {1, 2, 3, 4, 2, 4, 6, 8, 0, 1, 0, 1, 1, 0, 1, 0};
    return !Invert4(singular, inverse);
}

TESSARY_TEST(TestSparseMatrix)
{
    // [[4 0 1] [0 2 0] [1 0 3]] in compressed rows, times (1, 2, 3).
    const uint32_t rowStart[] = {0, 2, 3, 5};
    const uint32_t column[] = {0, 2, 1, 0, 2};
    const double value[] = {4, 1, 2, 1, 3};
    const double x[] = {1, 2, 3};
    const double expected[] = {7, 4, 10};
    for (int r = 0; r < 3; ++r)
    {
        double sum = 0;
        for (uint32_t k = rowStart[r]; k < rowStart[r + 1]; ++k)
            sum += value[k] * x[column[k]];
        if (sum != expected[r])
            return false;
    }
    return true;
}

TESSARY_TEST(TestTriMapBasic)
{
    Tessary_MeshDesc mesh;
    HashTab map;
    bool ok = MakeSample(&mesh) && BuildVertexTriangleMap(mesh, &map);
    uint32_t t = 99;
    ok = ok && map.count == 7 && map.Get(3, &t) && t == 1 && map.Get(4, &t) && t == 3 && !map.Get(7, &t);
    map.Release();
    Tessary_DestroyMeshDesc(&mesh);
    return ok;
}

TESSARY_TEST(TestTriMapVertexIndex)
{
    Tessary_MeshDesc mesh;
    HashTab map;
    bool ok = MakeSample(&mesh) && BuildVertexTriangleMap(mesh, &map);
    for (uint32_t v = 0; ok && v < mesh.vertexCount; ++v)
    {
        uint32_t t;
        const uint32_t* tri = mesh.indices + 3 * (map.Get(v, &t) ? t : 0);
        ok = map.Get(v, &t) && (tri[0] == v || tri[1] == v || tri[2] == v);
    }
    map.Release();
    Tessary_DestroyMeshDesc(&mesh);
    return ok;
}

TESSARY_TEST(TestCollapseEdgeBasic)
{
    Tessary_MeshDesc mesh;
    bool ok = MakeSample(&mesh);
    // Merging 2 into 1 flattens both square triangles; the sliver was already flat.
    ok = ok && CollapseEdge(&mesh, 1, 2) == 3 && mesh.triCount == 1 && mesh.indices[0] == 4;
    Tessary_DestroyMeshDesc(&mesh);
    return ok;
}

TESSARY_TEST(TestSplitConnected)
{
    Tessary_MeshDesc mesh;
    uint32_t component[4];
    bool ok = MakeSample(&mesh) && SplitConnected(mesh, component) == 2;
    ok = ok && component[0] == 0 && component[1] == 0 && component[2] == 0 && component[3] == 1;
    Tessary_DestroyMeshDesc(&mesh);
    return ok;
}

TESSARY_TEST(TestNonManifoldFixer)
{
    // Three triangles on the edge 0-1: the third makes it non-manifold and goes.
    const float positions[] = {0, 0, 0, 1, 0, 0, 0, 1, 0, 0, -1, 0, 0, 0, 1};
    const uint32_t indices[] = {0, 1, 2, 1, 0, 3, 0, 1, 4};
    Tessary_MeshDesc mesh;
    bool ok = MakeMesh(&mesh, positions, 5, indices, 3) && FixNonManifoldEdges(&mesh) == 1;
    ok = ok && mesh.triCount == 2 && mesh.indices[3] == 1 && mesh.indices[5] == 3;
    Tessary_DestroyMeshDesc(&mesh);
    return ok;
}

TESSARY_TEST(TestDegenerateRemoval)
{
    Tessary_MeshDesc mesh;
    Tessary_CleanupGeometryResult result = {0, 0};
    bool ok = MakeSample(&mesh);
    mesh.indices[11] = 40;   // out of range: goes as well
    Tessary_CleanupGeometry(&mesh, &result);
    ok = ok && result.removedTriangles == 2 && result.removedVertices == 3 && mesh.triCount == 2 && mesh.vertexCount == 4;
    Tessary_DestroyMeshDesc(&mesh);
    return ok;
}

TESSARY_TEST(TestArray)
{
    Array<uint32_t> values;
    bool ok = true;
    for (uint32_t i = 0; i < 1000; ++i)
        ok = ok && values.Push(i * 3);
    for (uint32_t i = 0; ok && i < 1000; ++i)
        ok = values[i] == i * 3;
    ok = ok && values.size == 1000 && values.capacity >= 1000;
    values.Release();
    return ok && values.data == nullptr;
}

TESSARY_TEST(TestBlobArray)
{
    BlobArray blobs;
    const char* words[] = {"a", "", "progressive", "mesh"};
    bool ok = true;
    for (int i = 0; i < 4; ++i)
        ok = ok && blobs.Add(words[i], (uint32_t)_mbstrlen(words[i]));
    for (uint32_t i = 0; ok && i < blobs.Count(); ++i)
    {
        uint32_t length;
        const uint8_t* blob = blobs.Get(i, &length);
        ok = length == _mbstrlen(words[i]) && memcmp(blob, words[i], length) == 0;
    }
    ok = ok && blobs.Count() == 4;
    blobs.Release();
    return ok;
}

TESSARY_TEST(TestHashTab)
{
    HashTab table;
    bool ok = true;
    for (uint32_t k = 0; k < 500; ++k)
        ok = ok && table.Set(k * 7919u, k);
    ok = ok && table.Set(7919u, 42) && table.count == 500;
    uint32_t value = 0;
    for (uint32_t k = 2; ok && k < 500; ++k)
        ok = table.Get(k * 7919u, &value) && value == k;
    ok = ok && table.Get(7919u, &value) && value == 42 && !table.Get(5, &value);
    table.Release();
    return ok;
}

TESSARY_TEST(TestPriorityQueue)
{
    PriorityQueue queue;
    const float priorities[] = {5, 1, 4, 2, 3, 0.5f, 9};
    bool ok = true;
    for (uint32_t i = 0; i < 7; ++i)
        ok = ok && queue.Push(priorities[i], i);
    PriorityQueue::Entry top;
    float last = -1;
    int popped = 0;
    while (ok && queue.Pop(&top))
    {
        ok = top.priority >= last && priorities[top.item] == top.priority;
        last = top.priority;
        ++popped;
    }
    queue.Release();
    return ok && popped == 7;
}

TESSARY_TEST(TestProgressiveMeshInternalCollapseEdge)
{
    Tessary_MeshDesc mesh, reduced = {0, 0, nullptr, nullptr};
    unsigned int* source = nullptr;
    bool ok = MakeSample(&mesh);
    Tessary_ProgressiveMesh pm = Tessary_CreateProgressiveMesh(mesh);
    // The sliver is dropped on creation (3 triangles remain). The shortest edge, 0-1, collapses
    // first and flattens triangle 0; triangle 1 survives as (2, 0, 3), the far one untouched.
    Tessary_PMUpdateTrianglesWithSourceInfo(pm, 2, &reduced, &source);
    ok = ok && reduced.triCount == 2 && source[0] == 1 && source[1] == 2 && Tessary_PMSplitCount(pm) == 1 &&
         reduced.indices[0] == 2 && reduced.indices[1] == 0 && reduced.indices[2] == 3;
    // Triangle 0 shares the merged corner 0 with triangle 1 and takes its segment.
    int segmentation[3] = {-1, 5, 7};
    Tessary_LiftSegmentationFromLod(pm, segmentation);
    ok = ok && segmentation[0] == 5 && segmentation[1] == 5 && segmentation[2] == 7;
    Tessary_Deallocate(source);
    Tessary_DestroyMeshDesc(&reduced);
    Tessary_DestroyProgressiveMesh(pm);
    Tessary_DestroyMeshDesc(&mesh);
    return ok;
}

TESSARY_TEST(TestSlidingWindowSimplePatchGenerate)
{
    // A strip of four triangles over a 3x2 vertex grid, cut into patches of a two-triangle window.
    const float positions[] = {0, 0, 0, 1, 0, 0, 2, 0, 0, 0, 1, 0, 1, 1, 0, 2, 1, 0};
    const uint32_t indices[] = {0, 1, 3, 1, 4, 3, 1, 2, 4, 2, 5, 4};
    Tessary_MeshDesc mesh;
    bool ok = MakeMesh(&mesh, positions, 6, indices, 4);
    uint32_t patches = 0;
    for (uint32_t start = 0; ok && start + 2 <= mesh.triCount; start += 2, ++patches)
    {
        Tessary_MeshDesc patch;
        uint32_t component[2];
        ok = MakeMesh(&patch, mesh.positions, mesh.vertexCount, mesh.indices + 3 * start, 2) &&
             SplitConnected(patch, component) == 1 && RemoveUnusedVertices(&patch) == 2 && patch.vertexCount == 4;
        Tessary_DestroyMeshDesc(&patch);
    }
    Tessary_DestroyMeshDesc(&mesh);
    return ok && patches == 2;
}
