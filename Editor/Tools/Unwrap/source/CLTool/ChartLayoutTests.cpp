// End-to-end tests of the bundled Unwrap.dll's default chart layout: the real ChartBake runs on
// small meshes written here, and the UVs it writes are checked for the layout's promises: charts
// follow the surface (flat and developable parts unroll to their true shape), keep within the
// distortion thresholds, sit inside the unit square with the margin around them, never overlap,
// never flip a triangle, and share one texel density.
#include "Runtime/Testing/ChildProcess.h"
#include "Runtime/Testing/TemporaryDirectory.h"
#include "Runtime/Testing/Testing.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <numeric>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

namespace
{
    struct Mesh
    {
        std::vector<float> positions;   // 3 a vertex
        std::vector<uint32_t> tri;      // 3 a triangle
        uint32_t TriCount() const { return uint32_t(tri.size() / 3); }
        uint32_t Add(float x, float y, float z)
        {
            positions.insert(positions.end(), {x, y, z});
            return uint32_t(positions.size() / 3 - 1);
        }
        void Face(uint32_t a, uint32_t b, uint32_t c) { tri.insert(tri.end(), {a, b, c}); }
    };

    struct Params
    {
        float angleDistortion = 0.08f, areaDistortion = 0.15f, hardAngle = 88.0f, packMargin = 1.0f / 256;
        uint32_t recollectVertices = 0;
    };

    struct Vec2
    {
        double x, y;
    };

    Vec2 Sub(Vec2 a, Vec2 b) { return {a.x - b.x, a.y - b.y}; }
    double Cross2(Vec2 a, Vec2 b) { return a.x * b.y - a.y * b.x; }

    // The UVs ChartBake wrote, one pair a corner, read back with the mesh they belong to.
    struct Layout
    {
        Mesh mesh;
        std::vector<float> uv;
        Vec2 Corner(uint32_t t, int c) const { return {uv[6 * t + 2 * c], uv[6 * t + 2 * c + 1]}; }
        double UVArea(uint32_t t) const { return 0.5 * Cross2(Sub(Corner(t, 1), Corner(t, 0)), Sub(Corner(t, 2), Corner(t, 0))); }
        double Area3(uint32_t t) const
        {
            const float* p[3];
            for (int c = 0; c < 3; ++c)
                p[c] = &mesh.positions[3 * mesh.tri[3 * t + c]];
            double a[3], b[3];
            for (int k = 0; k < 3; ++k)
                a[k] = p[1][k] - p[0][k], b[k] = p[2][k] - p[0][k];
            double x = a[1] * b[2] - a[2] * b[1], y = a[2] * b[0] - a[0] * b[2], z = a[0] * b[1] - a[1] * b[0];
            return 0.5 * std::sqrt(x * x + y * y + z * z);
        }
        bool Degenerate(uint32_t t) const { return Area3(t) < 1e-9; }
    };

    // The raw binary mesh, with a source-polygon block when srcPoly is not empty.
    std::string BinaryMesh(const Mesh& mesh, const Params& p, const std::vector<uint32_t>& srcPoly)
    {
        std::string bytes;
        auto put = [&bytes](const void* data, size_t size) { bytes.append(static_cast<const char*>(data), size); };
        const float params[4] = {p.angleDistortion, p.areaDistortion, p.hardAngle, p.packMargin};
        const uint32_t header[5] = {p.recollectVertices, uint32_t(mesh.positions.size() / 3), mesh.TriCount(), 0,
                                    srcPoly.empty() ? 0u : 1u};
        put(params, 16);
        put(header, 20);
        put(mesh.positions.data(), 4 * mesh.positions.size());
        put(mesh.tri.data(), 4 * mesh.tri.size());
        put(srcPoly.data(), 4 * srcPoly.size());
        return bytes;
    }

    // Triangles joined through corners of one vertex index with the very same UV form one chart.
    // Returns each triangle's chart number (0, 1, ... in order of first appearance).
    std::vector<uint32_t> Charts(const Layout& layout)
    {
        uint32_t n = layout.mesh.TriCount();
        std::vector<uint32_t> parent(n);
        std::iota(parent.begin(), parent.end(), 0);
        auto root = [&parent](uint32_t t) {
            while (parent[t] != t)
                t = parent[t] = parent[parent[t]];
            return t;
        };
        std::map<std::tuple<uint32_t, float, float>, uint32_t> firstUse;
        for (uint32_t t = 0; t < n; ++t)
            for (int c = 0; c < 3; ++c)
            {
                auto key = std::make_tuple(layout.mesh.tri[3 * t + c], layout.uv[6 * t + 2 * c], layout.uv[6 * t + 2 * c + 1]);
                auto [it, fresh] = firstUse.emplace(key, t);
                if (!fresh)
                    parent[root(t)] = root(it->second);
            }
        std::map<uint32_t, uint32_t> numbers;
        std::vector<uint32_t> chart(n);
        for (uint32_t t = 0; t < n; ++t)
            chart[t] = numbers.emplace(root(t), uint32_t(numbers.size())).first->second;
        return chart;
    }

    uint32_t ChartCount(const std::vector<uint32_t>& charts)
    {
        return charts.empty() ? 0 : *std::max_element(charts.begin(), charts.end()) + 1;
    }

    double PointSegmentDistance(Vec2 p, Vec2 a, Vec2 b)
    {
        Vec2 ab = Sub(b, a), ap = Sub(p, a);
        double length2 = ab.x * ab.x + ab.y * ab.y;
        double s = length2 > 0 ? std::clamp((ap.x * ab.x + ap.y * ab.y) / length2, 0.0, 1.0) : 0.0;
        double dx = ap.x - s * ab.x, dy = ap.y - s * ab.y;
        return std::sqrt(dx * dx + dy * dy);
    }

    bool SegmentsCross(Vec2 a, Vec2 b, Vec2 c, Vec2 d)
    {
        double d1 = Cross2(Sub(b, a), Sub(c, a)), d2 = Cross2(Sub(b, a), Sub(d, a));
        double d3 = Cross2(Sub(d, c), Sub(a, c)), d4 = Cross2(Sub(d, c), Sub(b, c));
        return ((d1 > 0) != (d2 > 0)) && ((d3 > 0) != (d4 > 0)) && d1 != 0 && d2 != 0 && d3 != 0 && d4 != 0;
    }

    bool InsideTriangle(Vec2 p, const Vec2* t)
    {
        double area = Cross2(Sub(t[1], t[0]), Sub(t[2], t[0]));
        if (std::fabs(area) < 1e-12)
            return false;
        double s = area > 0 ? 1 : -1;
        for (int c = 0; c < 3; ++c)
            if (s * Cross2(Sub(t[(c + 1) % 3], t[c]), Sub(p, t[c])) < 0)
                return false;
        return true;
    }

    // Distance between two UV triangles (0 when they overlap or touch).
    double TriangleDistance(const Layout& layout, uint32_t s, uint32_t t)
    {
        Vec2 a[3], b[3];
        for (int c = 0; c < 3; ++c)
            a[c] = layout.Corner(s, c), b[c] = layout.Corner(t, c);
        double best = 1e300;
        for (int i = 0; i < 3; ++i)
        {
            if (InsideTriangle(a[i], b) || InsideTriangle(b[i], a))
                return 0;
            for (int j = 0; j < 3; ++j)
            {
                Vec2 p = a[i], q = a[(i + 1) % 3], u = b[j], v = b[(j + 1) % 3];
                if (SegmentsCross(p, q, u, v))
                    return 0;
                best = std::min({best, PointSegmentDistance(p, u, v), PointSegmentDistance(q, u, v),
                                 PointSegmentDistance(u, p, q), PointSegmentDistance(v, p, q)});
            }
        }
        return best;
    }

    const double kTolerance = 1e-6;

    bool SharesAVertex(const Mesh& mesh, uint32_t s, uint32_t t)
    {
        for (int i = 0; i < 3; ++i)
            for (int j = 0; j < 3; ++j)
                if (mesh.tri[3 * s + i] == mesh.tri[3 * t + j])
                    return true;
        return false;
    }

    // The promises every layout keeps; "" when all hold, else the first one broken. Triangles of
    // one chart that share no vertex must not even touch (true of the meshes used here).
    std::string BrokenPromise(const Layout& layout, double margin, bool planarCharts)
    {
        char text[200];
        for (size_t i = 0; i < layout.uv.size(); ++i)
            if (!std::isfinite(layout.uv[i]) || layout.uv[i] < margin - kTolerance || layout.uv[i] > 1 - margin + kTolerance)
                return std::snprintf(text, sizeof text, "uv %zu = %g is not within the margin", i, layout.uv[i]), text;
        std::vector<uint32_t> charts = Charts(layout);
        double ratio = -1;
        for (uint32_t t = 0; t < layout.mesh.TriCount(); ++t)
        {
            if (layout.Degenerate(t))
                continue;
            if (!(layout.UVArea(t) > 0))
                return std::snprintf(text, sizeof text, "triangle %u is flipped or collapsed", t), text;
            double r = layout.UVArea(t) / layout.Area3(t);
            ratio = ratio < 0 ? r : ratio;
            if (planarCharts && std::fabs(r - ratio) > 1e-3 * ratio)
                return std::snprintf(text, sizeof text, "triangle %u has texel density %g, not %g", t, r, ratio), text;
        }
        for (uint32_t s = 0; s < layout.mesh.TriCount(); ++s)
            for (uint32_t t = s + 1; t < layout.mesh.TriCount(); ++t)
            {
                if (charts[s] != charts[t] && TriangleDistance(layout, s, t) < margin - kTolerance)
                    return std::snprintf(text, sizeof text, "triangles %u and %u of different charts are %g apart", s, t,
                                         TriangleDistance(layout, s, t)), text;
                if (charts[s] == charts[t] && !SharesAVertex(layout.mesh, s, t) && TriangleDistance(layout, s, t) == 0)
                    return std::snprintf(text, sizeof text, "triangles %u and %u of one chart overlap", s, t), text;
            }
        return "";
    }

    struct ChartsFixture : Testing::TemporaryDirectory
    {
        ChartsFixture() : TemporaryDirectory("chartbake-charts") {}

        // Unwraps `mesh` through the binary format; an empty layout when ChartBake fails.
        Layout Unwrap(const Mesh& mesh, const Params& params = Params(), const std::vector<uint32_t>& srcPoly = {}) const
        {
            std::ofstream(dir + "/mesh.bin", std::ios::binary) << BinaryMesh(mesh, params, srcPoly);
            Testing::ChildResult r = Testing::RunProgram({std::string(CHARTBAKE_BIN_DIR) + "/ChartBake", "mesh.bin", "out.bin"}, dir);
            Layout layout{mesh, {}};
            std::string bytes = Read("out.bin");
            if (r.exitStatus != 0 || bytes.size() != 24 * mesh.tri.size() / 3)
                return layout;
            layout.uv.resize(bytes.size() / 4);
            std::memcpy(layout.uv.data(), bytes.data(), bytes.size());
            return layout;
        }
    };

    Mesh FlatGrid(uint32_t quads)
    {
        Mesh mesh;
        for (uint32_t y = 0; y <= quads; ++y)
            for (uint32_t x = 0; x <= quads; ++x)
                mesh.Add(float(x), float(y), 0);
        for (uint32_t y = 0; y < quads; ++y)
            for (uint32_t x = 0; x < quads; ++x)
            {
                uint32_t a = y * (quads + 1) + x, b = a + 1, d = a + quads + 1, e = d + 1;
                mesh.Face(a, b, e);
                mesh.Face(a, e, d);
            }
        return mesh;
    }

    // A strip `length` long around part of a cylinder of radius 1 (`arc` radians, the x axis its
    // axis), `around` x `along` quads.
    Mesh Cylinder(uint32_t around, uint32_t along, double arc, double length = 2)
    {
        Mesh mesh;
        for (uint32_t i = 0; i <= around; ++i)
            for (uint32_t j = 0; j <= along; ++j)
            {
                double angle = arc * i / around;
                mesh.Add(float(length * j / along), float(std::cos(angle)), float(std::sin(angle)));
            }
        for (uint32_t i = 0; i < around; ++i)
            for (uint32_t j = 0; j < along; ++j)
            {
                uint32_t a = i * (along + 1) + j, b = a + 1, c = a + along + 2, d = a + along + 1;
                mesh.Face(a, d, c);
                mesh.Face(a, c, b);
            }
        return mesh;
    }

    // A strip of needles: `rows` rows of `cells` triangle pairs, each row shifted half a cell
    // against the last and only `spacing` of a cell away, so that every triangle has a corner near
    // 180 degrees; bent round a cylinder as wide as the strip is long.
    Mesh NeedleStrip(uint32_t cells, uint32_t rows, double spacing)
    {
        Mesh mesh;
        for (uint32_t j = 0; j <= rows; ++j)
            for (uint32_t i = 0; i <= cells; ++i)
            {
                double angle = (i + 0.5 * (j % 2)) / cells;
                mesh.Add(float(cells * std::sin(angle)), float(j * spacing), float(cells * (1 - std::cos(angle))));
            }
        auto at = [cells](uint32_t i, uint32_t j) { return j * (cells + 1) + i; };
        for (uint32_t j = 0; j < rows; ++j)
            for (uint32_t i = 0; i < cells; ++i)
                if (j % 2 == 0)
                {
                    mesh.Face(at(i, j), at(i + 1, j), at(i, j + 1));
                    mesh.Face(at(i + 1, j), at(i + 1, j + 1), at(i, j + 1));
                }
                else
                {
                    mesh.Face(at(i, j), at(i + 1, j + 1), at(i, j + 1));
                    mesh.Face(at(i, j), at(i + 1, j), at(i + 1, j + 1));
                }
        return mesh;
    }

    // A unit sphere of `around` x `rings` quads (triangles at the poles).
    Mesh Sphere(uint32_t around, uint32_t rings)
    {
        Mesh mesh;
        const double pi = 3.14159265358979323846;
        uint32_t north = mesh.Add(0, 0, 1);
        for (uint32_t j = 1; j < rings; ++j)
            for (uint32_t i = 0; i < around; ++i)
            {
                double theta = pi * j / rings, phi = 2 * pi * i / around;
                mesh.Add(float(std::sin(theta) * std::cos(phi)), float(std::sin(theta) * std::sin(phi)), float(std::cos(theta)));
            }
        uint32_t south = mesh.Add(0, 0, -1);
        auto at = [around](uint32_t j, uint32_t i) { return 1 + (j - 1) * around + i % around; };
        for (uint32_t i = 0; i < around; ++i)
        {
            mesh.Face(north, at(1, i), at(1, i + 1));
            mesh.Face(at(rings - 1, i), south, at(rings - 1, i + 1));
        }
        for (uint32_t j = 1; j + 1 < rings; ++j)
            for (uint32_t i = 0; i < around; ++i)
            {
                mesh.Face(at(j, i), at(j + 1, i), at(j + 1, i + 1));
                mesh.Face(at(j, i), at(j + 1, i + 1), at(j, i + 1));
            }
        return mesh;
    }

    // Per chart: (area distortion, angle distortion), the 3D-area-weighted means over its
    // triangles of max(r, 1/r) - 1, r = (UV area / chart UV area) / (3D area / chart 3D area), and
    // of the sum over corners of |UV angle - 3D angle| / pi.
    std::vector<std::pair<double, double>> ChartDistortions(const Layout& layout, const std::vector<uint32_t>& charts)
    {
        uint32_t count = ChartCount(charts);
        std::vector<double> uvArea(count), area(count), areaSum(count), angleSum(count);
        for (uint32_t t = 0; t < layout.mesh.TriCount(); ++t)
        {
            uvArea[charts[t]] += layout.UVArea(t);
            area[charts[t]] += layout.Area3(t);
        }
        auto angle3 = [&](uint32_t t, int c) {
            const float* p[3];
            for (int k = 0; k < 3; ++k)
                p[k] = &layout.mesh.positions[3 * layout.mesh.tri[3 * t + (c + k) % 3]];
            double a[3], b[3];
            for (int k = 0; k < 3; ++k)
                a[k] = p[1][k] - p[0][k], b[k] = p[2][k] - p[0][k];
            double dot = a[0] * b[0] + a[1] * b[1] + a[2] * b[2];
            double la = std::sqrt(a[0] * a[0] + a[1] * a[1] + a[2] * a[2]), lb = std::sqrt(b[0] * b[0] + b[1] * b[1] + b[2] * b[2]);
            return std::acos(std::clamp(dot / (la * lb), -1.0, 1.0));
        };
        for (uint32_t t = 0; t < layout.mesh.TriCount(); ++t)
        {
            uint32_t c = charts[t];
            double a3 = layout.Area3(t);
            double r = (layout.UVArea(t) / uvArea[c]) / (a3 / area[c]);
            areaSum[c] += a3 * (std::max(r, 1 / r) - 1);
            double angles = 0;
            for (int k = 0; k < 3; ++k)
            {
                Vec2 o = layout.Corner(t, k), p = layout.Corner(t, (k + 1) % 3), q = layout.Corner(t, (k + 2) % 3);
                Vec2 u = Sub(p, o), v = Sub(q, o);
                angles += std::fabs(std::atan2(std::fabs(Cross2(u, v)), u.x * v.x + u.y * v.y) - angle3(t, k)) / 3.14159265358979323846;
            }
            angleSum[c] += a3 * angles;
        }
        std::vector<std::pair<double, double>> result;
        for (uint32_t c = 0; c < count; ++c)
            result.push_back({areaSum[c] / area[c], angleSum[c] / area[c]});
        return result;
    }

    // Two triangles on the common edge (0,0,0)-(0,1,0): one in the plane z = 0, the other turned
    // up out of it, so that their normals are `degrees` apart.
    Mesh Fold(double degrees)
    {
        Mesh mesh;
        double turn = degrees * 3.14159265358979323846 / 180;
        mesh.Add(0, 0, 0);
        mesh.Add(0, 1, 0);
        mesh.Add(1, 0.5f, 0);
        mesh.Add(float(-std::cos(turn)), 0.5f, float(std::sin(turn)));
        mesh.Face(0, 2, 1);
        mesh.Face(0, 1, 3);
        return mesh;
    }
}

INTEGRATION_TEST_SUITE(ChartBakeCharts)
{
    TEST_FIXTURE(ChartsFixture, Cube_SixChartsOfTwoTrianglesSharingTheirDiagonal)
    {
        const char* const cube =
            "v 0 0 0\nv 1 0 0\nv 1 1 0\nv 0 1 0\nv 0 0 1\nv 1 0 1\nv 1 1 1\nv 0 1 1\nvt 0 0\n"
            "f 1/1/1 4/1/1 3/1/1\nf 1/1/1 3/1/1 2/1/1\nf 5/1/1 6/1/1 7/1/1\nf 5/1/1 7/1/1 8/1/1\n"
            "f 1/1/1 2/1/1 6/1/1\nf 1/1/1 6/1/1 5/1/1\nf 2/1/1 3/1/1 7/1/1\nf 2/1/1 7/1/1 6/1/1\n"
            "f 3/1/1 4/1/1 8/1/1\nf 3/1/1 8/1/1 7/1/1\nf 4/1/1 1/1/1 5/1/1\nf 4/1/1 5/1/1 8/1/1\n";
        std::ofstream(dir + "/cube.obj") << cube;
        Testing::ChildResult r = Testing::RunProgram({std::string(CHARTBAKE_BIN_DIR) + "/ChartBake", "-obj", "cube.obj", "out.obj"}, dir);
        CHECK_EQUAL(0, r.exitStatus);

        // Read back: the positions as given, a "vt" per corner and faces "f v/t v/t v/t".
        Layout layout;
        std::istringstream in(Read("out.obj"));
        std::vector<float> vts;
        for (std::string line; std::getline(in, line);)
        {
            float a, b, c;
            uint32_t v[3], t[3];
            if (std::sscanf(line.c_str(), "v %f %f %f", &a, &b, &c) == 3)
                layout.mesh.Add(a, b, c);
            else if (std::sscanf(line.c_str(), "vt %f %f", &a, &b) == 2)
                vts.insert(vts.end(), {a, b});
            else if (std::sscanf(line.c_str(), "f %u/%u %u/%u %u/%u", &v[0], &t[0], &v[1], &t[1], &v[2], &t[2]) == 6)
                for (int k = 0; k < 3; ++k)
                {
                    layout.mesh.tri.push_back(v[k] - 1);
                    layout.uv.insert(layout.uv.end(), {vts.at(2 * (t[k] - 1)), vts.at(2 * (t[k] - 1) + 1)});
                }
        }
        CHECK_EQUAL(12u, layout.mesh.TriCount());
        CHECK_EQUAL(36u, layout.uv.size() / 2);
        std::vector<uint32_t> charts = Charts(layout);
        CHECK_EQUAL(6u, ChartCount(charts));
        for (uint32_t face = 0; face < 6; ++face)
            CHECK_EQUAL(charts[2 * face], charts[2 * face + 1]);   // the two triangles of a face, through their diagonal
        // The OBJ output has six decimals: allow for them in the margins.
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256 - 1e-6, true));
    }

    TEST_FIXTURE(ChartsFixture, FlatGrid_OneChartWithOneUVPerVertex)
    {
        Layout layout = Unwrap(FlatGrid(4));
        CHECK_EQUAL(32u * 6, layout.uv.size());
        CHECK_EQUAL(1u, ChartCount(Charts(layout)));
        std::map<std::pair<float, float>, int> distinct;
        for (size_t i = 0; i + 1 < layout.uv.size(); i += 2)
            ++distinct[{layout.uv[i], layout.uv[i + 1]}];
        CHECK_EQUAL(25u, distinct.size());
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, true));
    }

    TEST_FIXTURE(ChartsFixture, Fold_ANewChartStartsBeyondTheHardAngle)
    {
        // Distortion limits wide open: only the dihedral angle decides.
        Params loose;
        loose.angleDistortion = 10;
        loose.areaDistortion = 1;
        loose.hardAngle = 45;
        const std::pair<double, uint32_t> cases[] = {{30, 1}, {44, 1}, {46, 2}, {80, 2}};
        for (const auto& [degrees, charts] : cases)
        {
            Layout layout = Unwrap(Fold(degrees), loose);
            CHECK_EQUAL(12u, layout.uv.size());
            CHECK_EQUAL(charts, ChartCount(Charts(layout)));
            CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, charts == 2));
        }
        // The defaults: a fold of 100 degrees is beyond hardAngle 88.
        Layout defaults = Unwrap(Fold(100));
        CHECK_EQUAL(2u, ChartCount(Charts(defaults)));
        CHECK_EQUAL("", BrokenPromise(defaults, 1.0 / 256, true));
    }

    TEST_FIXTURE(ChartsFixture, SourcePolygon_KeepsItsTrianglesTogetherAcrossAHardEdge)
    {
        Params loose;
        loose.angleDistortion = 10;
        loose.areaDistortion = 1;
        loose.hardAngle = 45;
        CHECK_EQUAL(2u, ChartCount(Charts(Unwrap(Fold(60), loose, {4, 5}))));
        Layout onePolygon = Unwrap(Fold(60), loose, {4, 4});
        CHECK_EQUAL(1u, ChartCount(Charts(onePolygon)));
        CHECK_EQUAL("", BrokenPromise(onePolygon, 1.0 / 256, false));
    }

    TEST_FIXTURE(ChartsFixture, SourcePolygon_QuadsOfACurvedSurfaceAreNeverCutBetweenCharts)
    {
        // A sphere needs many charts; each quad of its bands is one source polygon of two
        // triangles, and chart borders must run between quads, never along a quad's diagonal.
        Mesh sphere = Sphere(32, 16);
        uint32_t poles = 2 * 32;
        std::vector<uint32_t> srcPoly(sphere.TriCount());
        for (uint32_t t = 0; t < sphere.TriCount(); ++t)
            srcPoly[t] = t < poles ? t : poles + (t - poles) / 2;
        Params params;
        params.areaDistortion = 0.05f;   // small charts: many borders
        Layout layout = Unwrap(sphere, params, srcPoly);
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, false));
        std::vector<uint32_t> charts = Charts(layout);
        CHECK(ChartCount(charts) > 4);
        for (uint32_t t = poles; t + 1 < sphere.TriCount(); t += 2)
            CHECK_EQUAL(charts[t], charts[t + 1]);
    }

    TEST_FIXTURE(ChartsFixture, SourcePolygon_ALongStripIsCutOnlyBetweenItsPolygons)
    {
        // A 120:1 strip is too long for the square and gets cut across; its five source
        // polygons (48 x 2 quads each) must stay whole, so every cut runs between two of them,
        // though the cutter's first choice of levels (sixths of the length) lies inside them.
        const uint32_t columns = 240, rows = 2, block = 48;
        Mesh strip;
        for (uint32_t x = 0; x <= columns; ++x)
            for (uint32_t y = 0; y <= rows; ++y)
                strip.Add(float(x), float(y), 0);
        std::vector<uint32_t> srcPoly;
        for (uint32_t x = 0; x < columns; ++x)
            for (uint32_t y = 0; y < rows; ++y)
            {
                uint32_t a = x * (rows + 1) + y, b = a + rows + 1;
                strip.Face(a, b, b + 1);
                strip.Face(a, b + 1, a + 1);
                srcPoly.insert(srcPoly.end(), 2, x / block);
            }
        Layout layout = Unwrap(strip, Params(), srcPoly);
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, false));
        std::vector<uint32_t> charts = Charts(layout);
        CHECK(ChartCount(charts) >= 2);
        for (uint32_t t = 0; t < strip.TriCount() && !charts.empty(); ++t)
            CHECK_EQUAL(charts[t - t % (2 * rows * block)], charts[t]);
    }

    TEST_FIXTURE(ChartsFixture, RecollectVertices_WeldsSplitVerticesIntoOneChart)
    {
        // A square whose two triangles have their own copies of the diagonal's vertices.
        Mesh mesh;
        mesh.Add(0, 0, 0);
        mesh.Add(1, 0, 0);
        mesh.Add(1, 1, 0);
        mesh.Add(1, 1, 0);
        mesh.Add(0, 1, 0);
        mesh.Add(-0.0f, 0, 0);
        mesh.Face(0, 1, 2);
        mesh.Face(5, 3, 4);
        CHECK_EQUAL(2u, ChartCount(Charts(Unwrap(mesh))));
        Params weld;
        weld.recollectVertices = 1;
        Layout welded = Unwrap(mesh, weld);
        CHECK_EQUAL(12u, welded.uv.size());
        // One chart: the copies of a vertex got one UV.
        CHECK_EQUAL(welded.uv[0], welded.uv[6]);
        CHECK_EQUAL(welded.uv[1], welded.uv[7]);
        CHECK_EQUAL(welded.uv[4], welded.uv[8]);
        CHECK_EQUAL(welded.uv[5], welded.uv[9]);
        welded.mesh.tri = {0, 1, 2, 0, 2, 4};   // the copies replaced, as the library sees them
        CHECK_EQUAL(1u, ChartCount(Charts(welded)));
        CHECK_EQUAL("", BrokenPromise(welded, 1.0 / 256, true));
    }

    TEST_FIXTURE(ChartsFixture, Developable_AFoldAndACylinderStayOneChartAtTheirTrueShape)
    {
        // Within hardAngle a fold unrolls flat: one chart, one texel density (no distortion).
        Layout fold = Unwrap(Fold(60));
        CHECK_EQUAL(1u, ChartCount(Charts(fold)));
        CHECK_EQUAL("", BrokenPromise(fold, 1.0 / 256, true));
        // A third of a cylinder: the normals turn through 120 degrees, yet it is developable.
        Layout cylinder = Unwrap(Cylinder(24, 8, 2.0943951));
        CHECK_EQUAL(1u, ChartCount(Charts(cylinder)));
        CHECK_EQUAL("", BrokenPromise(cylinder, 1.0 / 256, true));
    }

    TEST_FIXTURE(ChartsFixture, Distortion_EveryChartOfASphereStaysWithinBothThresholds)
    {
        // A sphere cannot be flattened without area distortion: the threshold decides how small
        // its charts get. Measured per chart as the unwrapper defines it (3D-area-weighted means).
        Mesh sphere = Sphere(32, 16);
        std::vector<uint32_t> counts;
        for (float threshold : {0.15f, 0.05f, 0.02f})
        {
            Params params;
            params.areaDistortion = threshold;
            Layout layout = Unwrap(sphere, params);
            CHECK_EQUAL(sphere.tri.size() * 2, layout.uv.size());
            CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, false));
            std::vector<uint32_t> charts = Charts(layout);
            counts.push_back(ChartCount(charts));
            for (const auto& [area, angle] : ChartDistortions(layout, charts))
                CHECK(area <= threshold + 1e-4);
        }
        CHECK(counts[0] < counts[2]);   // a lower threshold, smaller charts
        CHECK(counts[2] <= 200u);
        // An angle threshold below what the conformal maps of the grown charts reach: the checks
        // split charts until every one keeps it.
        Params tight;
        tight.angleDistortion = 0.002f;
        Layout layout = Unwrap(sphere, tight);
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, false));
        std::vector<uint32_t> charts = Charts(layout);
        CHECK(ChartCount(charts) > counts[0]);
        for (const auto& [area, angle] : ChartDistortions(layout, charts))
            CHECK(angle <= tight.angleDistortion + 1e-4);
    }

    TEST_FIXTURE(ChartsFixture, Adjacency_AnEdgeOfThreeTrianglesJoinsNothing)
    {
        // Three triangles in one plane on the edge 0-1: two of them lie on the same side and
        // overlap, so joining across that edge would fold a chart onto itself.
        Mesh mesh;
        mesh.Add(0, 0, 0);
        mesh.Add(1, 0, 0);
        mesh.Add(0.5f, -1, 0);
        mesh.Add(0.3f, 1, 0);
        mesh.Add(0.7f, 1, 0);
        mesh.Face(0, 2, 1);
        mesh.Face(1, 3, 0);
        mesh.Face(1, 4, 0);
        Layout layout = Unwrap(mesh);
        CHECK_EQUAL(3u, ChartCount(Charts(layout)));
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, true));
    }

    TEST_FIXTURE(ChartsFixture, Spiral_ARampThatWindsOverItselfIsSplit)
    {
        // A ramp between radii 1 and 2 climbing gently through one and a quarter turns: every
        // step joins its neighbour, but seen from above the ramp covers itself.
        Mesh mesh;
        const int steps = 50;
        for (int i = 0; i <= steps; ++i)
        {
            double angle = 2.5 * 3.14159265358979323846 * i / steps;
            for (double radius : {1.0, 2.0})
                mesh.Add(float(radius * std::cos(angle)), float(radius * std::sin(angle)), float(0.1 * angle));
        }
        for (uint32_t i = 0; i < steps; ++i)
        {
            mesh.Face(2 * i, 2 * i + 1, 2 * i + 3);
            mesh.Face(2 * i, 2 * i + 3, 2 * i + 2);
        }
        Layout layout = Unwrap(mesh);
        CHECK_EQUAL(2u * steps * 6, layout.uv.size());
        uint32_t charts = ChartCount(Charts(layout));
        CHECK(charts >= 2 && charts <= 4);
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, false));
    }

    TEST_FIXTURE(ChartsFixture, Degenerate_TrianglesStillGetValidUVs)
    {
        Mesh mesh = FlatGrid(1);
        uint32_t p = mesh.Add(3, 3, 3), q = mesh.Add(3, 3, 3), s = mesh.Add(5, 3, 3), u = mesh.Add(4, 3, 3);
        mesh.Face(p, q, s);   // two corners on one position
        mesh.Face(p, p, s);   // a repeated index
        mesh.Face(p, s, u);   // three corners on a line
        mesh.Face(p, q, p);   // a single point
        mesh.Face(0, 1, 1);   // a repeated index on an edge of the quad
        Layout layout = Unwrap(mesh);
        CHECK_EQUAL(7u * 6, layout.uv.size());
        std::vector<uint32_t> charts = Charts(layout);
        CHECK_EQUAL(charts[0], charts[1]);
        for (uint32_t t = 2; t < 6; ++t)   // corners the quad's chart does not hold: charts of their own
            CHECK(charts[t] != charts[0]);
        CHECK_EQUAL(charts[0], charts[6]);   // the quad's own corners: it joins the quad's chart
        CHECK_EQUAL(layout.uv[36], layout.uv[0]);
        CHECK_EQUAL(layout.uv[37], layout.uv[1]);
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, true));
    }

    TEST_FIXTURE(ChartsFixture, Report_CountsTheChartsThatFailedTheirChecksAndWereSplit)
    {
        // Under an angle threshold the sphere's grown charts cannot keep, flattening splits them:
        // every split adds at least one chart, and what is accepted keeps the threshold.
        Params tight;
        tight.angleDistortion = 0.002f;
        std::ofstream(dir + "/mesh.bin", std::ios::binary) << BinaryMesh(Sphere(32, 16), tight, {});
        Testing::ChildResult r = Testing::RunProgram({std::string(CHARTBAKE_BIN_DIR) + "/ChartBake", "mesh.bin", "out.bin"}, dir,
                                                     {"CHARTBAKE_LIBRARY_BEHAVIOUR=unwrap-report-stats"});
        CHECK_EQUAL(0, r.exitStatus);
        unsigned segmented = 0, splits = 0, charts = 0;
        double angle = 1, area = 1;
        CHECK_EQUAL(5, std::sscanf(r.out.c_str(), "segmented %u charts, %u splits, %u charts, angle distortion %lf, area distortion %lf",
                                   &segmented, &splits, &charts, &angle, &area));
        CHECK(splits > 0);
        CHECK(charts >= segmented + splits);
        CHECK(angle <= 0.002 && area <= 0.15);
    }

    TEST_FIXTURE(ChartsFixture, Needles_ObtuseTrianglesEverywhereStillFlattenAsOneChart)
    {
        // Corners near 180 degrees give the conformal matrix large positive off-diagonal entries:
        // eliminating it meets pivots that are not positive, which the solver must survive
        // (without that, the map goes wrong and the strip is split into hundreds of charts).
        Mesh strip = NeedleStrip(24, 24, 0.05);
        std::ofstream(dir + "/mesh.bin", std::ios::binary) << BinaryMesh(strip, Params(), {});
        Testing::ChildResult r = Testing::RunProgram({std::string(CHARTBAKE_BIN_DIR) + "/ChartBake", "mesh.bin", "out.bin"}, dir,
                                                     {"CHARTBAKE_LIBRARY_BEHAVIOUR=unwrap-report-stats"});
        CHECK_EQUAL(0, r.exitStatus);
        unsigned segmented = 0, splits = 1, charts = 0, cuts = 0;
        double angle = 1, area = 1;
        CHECK_EQUAL(6, std::sscanf(r.out.c_str(), "segmented %u charts, %u splits, %u charts, angle distortion %lf, area distortion %lf, %u cuts",
                                   &segmented, &splits, &charts, &angle, &area, &cuts));
        CHECK_EQUAL(1u, segmented);
        CHECK_EQUAL(0u, splits);
        // The long strip may still be cut into pieces that pack better; each cut adds one chart.
        CHECK_EQUAL(1u + cuts, charts);
        Layout layout = Unwrap(strip);
        CHECK_EQUAL(charts, ChartCount(Charts(layout)));
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, false));
    }

    TEST_FIXTURE(ChartsFixture, SlitSaddle_ChartsThatWouldWrapItsCentreAreNotMerged)
    {
        // A wavy disk slit along one radius: its centre gathers about 1.1 full turns of angle, and
        // the slit leaves its fan open, so one chart holding all of it folds over itself. Grown
        // charts stop short of that; merging two of them must not make it, or flattening splits
        // the union again, into dozens of pieces.
        const uint32_t spokes = 64, rings = 4;
        Mesh disk;
        disk.Add(0, 0, 0);
        for (uint32_t r = 1; r <= rings; ++r)
            for (uint32_t i = 0; i <= spokes; ++i)   // spoke `spokes` lies on spoke 0: the slit
            {
                double angle = 2 * M_PI * i / spokes;
                disk.Add(float(r * std::cos(angle)), float(r * std::sin(angle)), float(0.3 * r * std::sin(3 * angle)));
            }
        for (uint32_t i = 0; i < spokes; ++i)
            disk.Face(0, 1 + i, 2 + i);
        for (uint32_t r = 1; r < rings; ++r)
            for (uint32_t i = 0; i < spokes; ++i)
            {
                uint32_t a = 1 + (r - 1) * (spokes + 1) + i, b = a + spokes + 1;
                disk.Face(a, b, b + 1);
                disk.Face(a, b + 1, a + 1);
            }
        std::ofstream(dir + "/mesh.bin", std::ios::binary) << BinaryMesh(disk, Params(), {});
        Testing::ChildResult r = Testing::RunProgram({std::string(CHARTBAKE_BIN_DIR) + "/ChartBake", "mesh.bin", "out.bin"}, dir,
                                                     {"CHARTBAKE_LIBRARY_BEHAVIOUR=unwrap-report-stats"});
        CHECK_EQUAL(0, r.exitStatus);
        unsigned segmented = 0, splits = 1, charts = 0;
        CHECK_EQUAL(3, std::sscanf(r.out.c_str(), "segmented %u charts, %u splits, %u charts", &segmented, &splits, &charts));
        CHECK_EQUAL(0u, splits);
        CHECK(segmented >= 2 && charts <= 3);
        CHECK_EQUAL("", BrokenPromise(Unwrap(disk), 1.0 / 256, false));
    }

    TEST_FIXTURE(ChartsFixture, Sliver_ThinnerThanFloatUVsResolveStillUnwraps)
    {
        // A 200 x 200 grid and, on its border, a triangle 1e-7 high: at the layout's scale its
        // height is far below the spacing of float UVs, so its UV area cannot keep a sign. The
        // unwrap still succeeds and every other triangle keeps its orientation.
        Mesh mesh = FlatGrid(200);
        uint32_t tip = mesh.Add(0.5f, -1e-7f, 0);
        mesh.Face(0, tip, 1);
        Layout layout = Unwrap(mesh);
        CHECK_EQUAL(mesh.tri.size() * 2, layout.uv.size());
        uint32_t flipped = 0;
        for (uint32_t t = 0; t + 1 < mesh.TriCount() && !layout.uv.empty(); ++t)
            flipped += !(layout.UVArea(t) > 0);
        CHECK_EQUAL(0u, flipped);
    }

    TEST_FIXTURE(ChartsFixture, FewLargeCharts_PackAtTheFineAtlasDensityWithAnyMargin)
    {
        // The six sides of a cube: few large charts are first packed on a coarse bitmap, whose
        // fat outlines alone cover about 0.58 of the square; the fine bitmap must then take the
        // layout further (0.64 at the default margin), and a wide margin must hold on both.
        Mesh cube;
        for (int i = 0; i < 8; ++i)
            cube.Add(float(i & 1), float((i >> 1) & 1), float(i >> 2));
        const uint32_t quads[6][4] = {{0, 2, 3, 1}, {4, 5, 7, 6}, {0, 1, 5, 4}, {1, 3, 7, 5}, {3, 2, 6, 7}, {2, 0, 4, 6}};
        for (const uint32_t* q : quads)
            cube.Face(q[0], q[1], q[2]), cube.Face(q[0], q[2], q[3]);
        for (float margin : {1.0f / 256, 0.05f})
        {
            Params params;
            params.packMargin = margin;
            Layout layout = Unwrap(cube, params);
            CHECK_EQUAL(12u * 6, layout.uv.size());
            CHECK_EQUAL(6u, ChartCount(Charts(layout)));
            CHECK_EQUAL("", BrokenPromise(layout, margin, true));
            double covered = 0;
            for (uint32_t t = 0; t < layout.mesh.TriCount(); ++t)
                covered += layout.UVArea(t);
            if (margin < 0.01f)
                CHECK(covered > 0.62);
        }
    }

    TEST_FIXTURE(ChartsFixture, Holes_SmallChartsFillTheHoleOfAFrame)
    {
        // A flat square frame (16 x 16 quads of side 0.25 without the middle 8 x 8: a chart of
        // many triangles, drawn from its outline, inner edges included) and twelve loose squares
        // of side 0.4 in other planes. The frame spans the square's side; the squares fit only
        // into its hole, which the skyline cannot reach: the hole search must find it, and the
        // frame's drawing must leave it empty.
        Mesh mesh;
        const int n = 16;
        uint32_t grid[n + 1][n + 1];
        for (int i = 0; i <= n; ++i)
            for (int j = 0; j <= n; ++j)
                grid[i][j] = mesh.Add(0.25f * i, 0.25f * j, 0);
        auto inHole = [](int i, int j) { return i >= n / 4 && i < 3 * n / 4 && j >= n / 4 && j < 3 * n / 4; };
        for (int i = 0; i < n; ++i)
            for (int j = 0; j < n; ++j)
                if (!inHole(i, j))
                    mesh.Face(grid[i][j], grid[i + 1][j], grid[i + 1][j + 1]), mesh.Face(grid[i][j], grid[i + 1][j + 1], grid[i][j + 1]);
        const uint32_t frameTriangles = mesh.TriCount();
        for (int k = 0; k < 12; ++k)
        {
            float z = 5.0f + k;
            uint32_t a = mesh.Add(0, 0, z), b = mesh.Add(0.4f, 0, z), c = mesh.Add(0.4f, 0.4f, z), d = mesh.Add(0, 0.4f, z);
            mesh.Face(a, b, c), mesh.Face(a, c, d);
        }
        Layout layout = Unwrap(mesh);
        CHECK_EQUAL(size_t(6) * mesh.TriCount(), layout.uv.size());
        if (layout.uv.empty())
            return;
        CHECK_EQUAL("", BrokenPromise(layout, 1.0 / 256, true));
        // The hole's corners in UV: the frame's inner grid points at 1 and 3.
        double low[2] = {1, 1}, high[2] = {0, 0};
        for (uint32_t t = 0; t < frameTriangles; ++t)
            for (int c = 0; c < 3; ++c)
            {
                const float* p = &mesh.positions[3 * mesh.tri[3 * t + c]];
                if ((p[0] == 1 || p[0] == 3) && (p[1] == 1 || p[1] == 3))
                    for (int k = 0; k < 2; ++k)
                        low[k] = std::min(low[k], double(layout.uv[6 * t + 2 * c + k])),
                        high[k] = std::max(high[k], double(layout.uv[6 * t + 2 * c + k]));
            }
        uint32_t inside = 0;
        for (uint32_t t = frameTriangles; t < mesh.TriCount(); ++t)
        {
            bool in = true;
            for (int c = 0; c < 3; ++c)
                for (int k = 0; k < 2; ++k)
                    in = in && layout.uv[6 * t + 2 * c + k] > low[k] && layout.uv[6 * t + 2 * c + k] < high[k];
            inside += in;
        }
        CHECK_EQUAL(mesh.TriCount() - frameTriangles, inside);
    }

    TEST_FIXTURE(ChartsFixture, ManyCharts_PackedApartAtOneScale)
    {
        // 150 loose triangles of varied size and shape, in varied planes.
        Mesh mesh;
        std::srand(7);
        auto random = [] { return float(std::rand()) / RAND_MAX; };
        for (int i = 0; i < 150; ++i)
        {
            float size = 0.2f + 3 * random(), x = 10 * random(), y = 10 * random(), z = 10 * random();
            uint32_t a = mesh.Add(x, y, z);
            uint32_t b = mesh.Add(x + size, y + size * random(), z + random());
            uint32_t c = mesh.Add(x + size * random(), y + size * (0.3f + random()), z - random());
            mesh.Face(a, b, c);
        }
        Params params;
        params.packMargin = 0.01f;
        Layout layout = Unwrap(mesh, params);
        CHECK_EQUAL(150u * 6, layout.uv.size());
        CHECK_EQUAL(150u, ChartCount(Charts(layout)));
        CHECK_EQUAL("", BrokenPromise(layout, 0.01, true));
        double covered = 0;
        for (uint32_t t = 0; t < layout.mesh.TriCount(); ++t)
            covered += layout.UVArea(t);
        CHECK(covered > 0.2);
    }
}
