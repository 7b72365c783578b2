#pragma once
// Generated meshes for the unwrap tests and the quality benchmark, and the raw binary mesh file
// they are handed to ChartBake in.

#include <cstdint>
#include <string>
#include <vector>

namespace UVStat
{
    struct TestMesh
    {
        std::vector<float> positions;   // 3 a vertex
        std::vector<uint32_t> tri;      // 3 a triangle
        uint32_t VertexCount() const { return uint32_t(positions.size() / 3); }
        uint32_t TriCount() const { return uint32_t(tri.size() / 3); }
        uint32_t Add(double x, double y, double z);
        void Face(uint32_t a, uint32_t b, uint32_t c) { tri.insert(tri.end(), {a, b, c}); }
        // Appends `other` with its vertices renumbered.
        void Append(const TestMesh& other);
    };

    // The unwrapping parameters as stored in the binary file (defaults as ChartBake's).
    struct TestParams
    {
        float angleDistortion = 0.08f, areaDistortion = 0.15f, hardAngle = 88.0f, packMargin = 1.0f / 256;
        int32_t recollectVertices = 0;
    };

    // Closed surfaces; about 2 * rings * segments triangles.
    TestMesh Sphere(uint32_t rings, uint32_t segments, double radius = 1);
    TestMesh Torus(uint32_t around, uint32_t tube, double major = 1, double minor = 0.4);
    // A cube of six faces, each a grid of cells x cells quads.
    TestMesh Cube(uint32_t cells);
    // One vertex surrounded by `spokes` triangles whose rim goes up and down `waves` times: a
    // monkey-saddle-like fan whose angles sum far beyond 360 degrees.
    TestMesh SaddleFan(uint32_t spokes, uint32_t waves, double height);
    // `count` separate tetrahedra of varied sizes, in a row.
    TestMesh ManyComponents(uint32_t count);
    // `count` separate triangles, tilted and of varied sizes, in rows.
    TestMesh ManyTriangles(uint32_t count);
    // A grid strip with a fin (an edge of three triangles), a duplicated face, a face with the
    // opposite winding over the same vertices, and collinear and zero-size triangles.
    TestMesh DirtyMesh();

    // The raw little-endian binary input of ChartBake.
    std::string BinaryMeshFile(const TestMesh& mesh, const TestParams& params = TestParams());
    bool WriteBinaryMeshFile(const std::string& path, const TestMesh& mesh, const TestParams& params = TestParams());
}
