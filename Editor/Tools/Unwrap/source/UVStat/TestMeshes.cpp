// Generators of the test and benchmark meshes. Every mesh is closed or open as named, with
// counter-clockwise faces seen from outside.
#include "Editor/Tools/Unwrap/source/UVStat/TestMeshes.h"

#include <cmath>
#include <cstring>
#include <fstream>

namespace UVStat
{
    uint32_t TestMesh::Add(double x, double y, double z)
    {
        positions.insert(positions.end(), {float(x), float(y), float(z)});
        return VertexCount() - 1;
    }

    void TestMesh::Append(const TestMesh& other)
    {
        uint32_t base = VertexCount();
        positions.insert(positions.end(), other.positions.begin(), other.positions.end());
        for (uint32_t index : other.tri)
            tri.push_back(index + base);
    }

    TestMesh Sphere(uint32_t rings, uint32_t segments, double radius)
    {
        TestMesh mesh;
        uint32_t south = mesh.Add(0, 0, -radius);
        for (uint32_t r = 1; r < rings; ++r)
        {
            double polar = M_PI * r / rings;
            for (uint32_t s = 0; s < segments; ++s)
            {
                double azimuth = 2 * M_PI * s / segments;
                mesh.Add(radius * std::sin(polar) * std::cos(azimuth), radius * std::sin(polar) * std::sin(azimuth),
                         -radius * std::cos(polar));
            }
        }
        uint32_t north = mesh.Add(0, 0, radius);
        auto at = [segments](uint32_t ring, uint32_t s) { return 1 + (ring - 1) * segments + s % segments; };
        for (uint32_t s = 0; s < segments; ++s)
        {
            mesh.Face(south, at(1, s + 1), at(1, s));
            mesh.Face(north, at(rings - 1, s), at(rings - 1, s + 1));
            for (uint32_t r = 1; r + 1 < rings; ++r)
            {
                mesh.Face(at(r, s), at(r, s + 1), at(r + 1, s + 1));
                mesh.Face(at(r, s), at(r + 1, s + 1), at(r + 1, s));
            }
        }
        return mesh;
    }

    TestMesh Torus(uint32_t around, uint32_t tube, double major, double minor)
    {
        TestMesh mesh;
        for (uint32_t i = 0; i < around; ++i)
            for (uint32_t j = 0; j < tube; ++j)
            {
                double a = 2 * M_PI * i / around, b = 2 * M_PI * j / tube;
                double ring = major + minor * std::cos(b);
                mesh.Add(ring * std::cos(a), ring * std::sin(a), minor * std::sin(b));
            }
        auto at = [around, tube](uint32_t i, uint32_t j) { return (i % around) * tube + j % tube; };
        for (uint32_t i = 0; i < around; ++i)
            for (uint32_t j = 0; j < tube; ++j)
            {
                mesh.Face(at(i, j), at(i + 1, j), at(i + 1, j + 1));
                mesh.Face(at(i, j), at(i + 1, j + 1), at(i, j + 1));
            }
        return mesh;
    }

    TestMesh Cube(uint32_t cells)
    {
        TestMesh mesh;
        // Each face: an origin corner and two edge directions whose cross product points outwards.
        const int faces[6][9] = {{0, 0, 0, 0, 1, 0, 1, 0, 0}, {0, 0, 1, 1, 0, 0, 0, 1, 0}, {0, 0, 0, 1, 0, 0, 0, 0, 1},
                                 {0, 1, 0, 0, 0, 1, 1, 0, 0}, {0, 0, 0, 0, 0, 1, 0, 1, 0}, {1, 0, 0, 0, 1, 0, 0, 0, 1}};
        for (const int* f : faces)
        {
            uint32_t base = mesh.VertexCount();
            for (uint32_t y = 0; y <= cells; ++y)
                for (uint32_t x = 0; x <= cells; ++x)
                {
                    double s = double(x) / cells, t = double(y) / cells;
                    mesh.Add(f[0] + s * f[3] + t * f[6], f[1] + s * f[4] + t * f[7], f[2] + s * f[5] + t * f[8]);
                }
            for (uint32_t y = 0; y < cells; ++y)
                for (uint32_t x = 0; x < cells; ++x)
                {
                    uint32_t a = base + y * (cells + 1) + x, b = a + 1, c = a + cells + 2, d = a + cells + 1;
                    mesh.Face(a, b, c);
                    mesh.Face(a, c, d);
                }
        }
        return mesh;
    }

    TestMesh SaddleFan(uint32_t spokes, uint32_t waves, double height)
    {
        TestMesh mesh;
        uint32_t centre = mesh.Add(0, 0, 0);
        for (uint32_t s = 0; s < spokes; ++s)
        {
            double a = 2 * M_PI * s / spokes;
            mesh.Add(std::cos(a), std::sin(a), height * std::sin(waves * a));
        }
        for (uint32_t s = 0; s < spokes; ++s)
            mesh.Face(centre, 1 + s, 1 + (s + 1) % spokes);
        return mesh;
    }

    TestMesh ManyComponents(uint32_t count)
    {
        TestMesh mesh;
        for (uint32_t i = 0; i < count; ++i)
        {
            double size = 0.5 + 0.5 * ((i * 7919u) % 13) / 13.0, x = 2.0 * (i % 100), y = 2.0 * (i / 100);
            uint32_t a = mesh.Add(x, y, 0), b = mesh.Add(x + size, y, 0), c = mesh.Add(x, y + size, 0),
                     d = mesh.Add(x, y, size);
            mesh.Face(a, c, b);
            mesh.Face(a, b, d);
            mesh.Face(a, d, c);
            mesh.Face(b, c, d);
        }
        return mesh;
    }

    TestMesh ManyTriangles(uint32_t count)
    {
        TestMesh mesh;
        for (uint32_t i = 0; i < count; ++i)
        {
            double size = 0.6 + 0.4 * ((i * 7919u) % 11) / 11.0, x = 2.0 * (i % 128), y = 2.0 * (i / 128);
            uint32_t a = mesh.Add(x, y, 0), b = mesh.Add(x + size, y, 0.2 * size), c = mesh.Add(x, y + size, 0.3);
            mesh.Face(a, b, c);
        }
        return mesh;
    }

    TestMesh DirtyMesh()
    {
        TestMesh mesh;
        const uint32_t n = 8;
        for (uint32_t y = 0; y <= n; ++y)
            for (uint32_t x = 0; x <= n; ++x)
                mesh.Add(x, y, 0.1 * std::sin(double(x)) * y);
        for (uint32_t y = 0; y < n; ++y)
            for (uint32_t x = 0; x < n; ++x)
            {
                uint32_t a = y * (n + 1) + x, b = a + 1, c = a + n + 2, d = a + n + 1;
                mesh.Face(a, b, c);
                mesh.Face(a, c, d);
            }
        uint32_t fin = mesh.Add(4, 4, 3);    // a third triangle on the edge (40, 41)
        mesh.Face(40, 41, fin);
        mesh.Face(0, 1, 10);                 // duplicate of the first face
        mesh.Face(20, 11, 10);               // face (10, 11, 20) again, wound the other way
        uint32_t p = mesh.Add(20, 0, 0), q = mesh.Add(21, 0, 0), r = mesh.Add(22, 0, 0);
        mesh.Face(p, q, r);                  // collinear corners
        mesh.Face(p, p, q);                  // a repeated corner
        uint32_t s = mesh.Add(30, 0, 0), t = mesh.Add(30, 0, 0), u = mesh.Add(30, 0, 0);
        mesh.Face(s, t, u);                  // three vertices at one point
        return mesh;
    }

    std::string BinaryMeshFile(const TestMesh& mesh, const TestParams& params)
    {
        std::string bytes;
        auto put = [&bytes](const void* data, size_t size) { bytes.append(static_cast<const char*>(data), size); };
        const float floats[4] = {params.angleDistortion, params.areaDistortion, params.hardAngle, params.packMargin};
        const uint32_t header[4] = {mesh.VertexCount(), mesh.TriCount(), 0, 0};
        put(floats, 16);
        put(&params.recollectVertices, 4);
        put(header, 16);
        put(mesh.positions.data(), 4 * mesh.positions.size());
        put(mesh.tri.data(), 4 * mesh.tri.size());
        return bytes;
    }

    bool WriteBinaryMeshFile(const std::string& path, const TestMesh& mesh, const TestParams& params)
    {
        std::ofstream out(path, std::ios::binary);
        std::string bytes = BinaryMeshFile(mesh, params);
        out.write(bytes.data(), std::streamsize(bytes.size()));
        return bool(out);
    }
}
