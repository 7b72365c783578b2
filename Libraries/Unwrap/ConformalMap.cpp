#include "ConformalMap.h"

#include "HermitianSolver.h"
#include "WinImports.h"

namespace
{
    const double kMaxCotangent = 1e4;   // slivers: keeps the matrix finite and the solver steady
    const double kResidualResolution = 1.0 / 68719476736.0;   // 2^-36 of the chart's size

    // Cotangent of the 3D corner angle at corner c of triangle t, clamped.
    double Cotangent(const ChartMesh& mesh, uint32_t t, uint32_t c)
    {
        const uint32_t* v = mesh.tri + 3 * t;
        Vec3 p = Position(mesh.vertex, v[c]);
        Vec3 a = Position(mesh.vertex, v[(c + 1) % 3]) - p, b = Position(mesh.vertex, v[(c + 2) % 3]) - p;
        double sine = Length(Cross(a, b)), cosine = Dot(a, b);
        double cot = sine > 0 ? cosine / sine : kMaxCotangent;
        return cot > kMaxCotangent ? kMaxCotangent : (cot < -kMaxCotangent ? -kMaxCotangent : cot);
    }

    // The conformal energy's matrix: per directed triangle edge a -> b with opposite corner k,
    // L gets w = cot(angle at k) / 2 on both diagonals and -w off them, B gets +1/2 at (a, b) and
    // -1/2 at (b, a) (the area form). Assembled in place (HermitianMatrix::Start), the diagonal
    // summed in triangle order.
    bool BuildConformalMatrix(const ChartMesh& mesh, const uint32_t* triangles, uint32_t count, const uint32_t* corner,
                              uint32_t vertices, HermitianMatrix* h)
    {
        if (!h->Start(vertices))
            return false;
        for (uint32_t i = 0; i < 3 * count; ++i)
            h->Count(corner[i]), h->Count(corner[i % 3 == 2 ? i - 2 : i + 1]);
        if (!h->Place())
            return false;
        for (uint32_t i = 0; i < count; ++i)
            for (uint32_t c = 0; c < 3; ++c)
            {
                uint32_t a = corner[3 * i + c], b = corner[3 * i + (c + 1) % 3];
                double w = 0.5 * Cotangent(mesh, triangles[i], (c + 2) % 3);
                h->Put(a, {b, -w, 0.5});
                h->Put(b, {a, -w, -0.5});
                h->diag[a] += w;
                h->diag[b] += w;
            }
        return h->Finish();
    }

    double SignedArea(const double* uv, uint32_t a, uint32_t b, uint32_t c)
    {
        return 0.5 * ((uv[2 * b] - uv[2 * a]) * (uv[2 * c + 1] - uv[2 * a + 1]) -
                      (uv[2 * c] - uv[2 * a]) * (uv[2 * b + 1] - uv[2 * a + 1]));
    }
}

bool ConformalMapper::Allocate(const ChartMesh& mesh)
{
    m_Mesh = &mesh;
    if (!m_LocalOf.Allocate(mesh.vertexCount + 1ull) || !m_Stamp.Allocate(mesh.vertexCount + 1ull))
        return false;
    memset(m_Stamp.Data(), 0, (mesh.vertexCount + 1ull) * sizeof(uint32_t));
    m_Pass = 0;
    return true;
}

bool ConformalMapper::Number(const uint32_t* triangles, uint32_t count, FlatChart* out)
{
    if (++m_Pass == 0)
    {
        memset(m_Stamp.Data(), 0, (m_Mesh->vertexCount + 1ull) * sizeof(uint32_t));
        m_Pass = 1;
    }
    if (!out->corner.Allocate(3ull * count) || !out->global.Allocate(3ull * count))
        return false;
    uint32_t n = 0;
    for (uint32_t i = 0; i < count; ++i)
        for (uint32_t c = 0; c < 3; ++c)
        {
            uint32_t v = m_Mesh->tri[3 * triangles[i] + c];
            if (m_Stamp[v] != m_Pass)
            {
                m_Stamp[v] = m_Pass;
                m_LocalOf[v] = n;
                out->global[n++] = v;
            }
            out->corner[3 * i + c] = m_LocalOf[v];
        }
    out->vertexCount = n;
    return out->uv.Allocate(2ull * n);
}

void ConformalMapper::Project(const uint32_t* triangles, uint32_t count, FlatChart* out, uint32_t* pin0, uint32_t* pin1)
{
    const ChartMesh& mesh = *m_Mesh;
    Vec3 sum = {0, 0, 0};
    for (uint32_t i = 0; i < count; ++i)
        sum = sum + mesh.normal[triangles[i]] * mesh.area[triangles[i]];
    Vec3 normal = Normalized(sum);
    if (Dot(normal, normal) == 0)
        normal = mesh.normal[triangles[0]];
    double ax = Abs(normal.x), ay = Abs(normal.y), az = Abs(normal.z);
    Vec3 axis = ax <= ay && ax <= az ? Vec3{1, 0, 0} : (ay <= az ? Vec3{0, 1, 0} : Vec3{0, 0, 1});
    Vec3 bu = Normalized(Cross(normal, axis)), bv = Cross(normal, bu);   // bu x bv = normal
    Vec3 origin = Position(mesh.vertex, out->global[0]);
    uint32_t n = out->vertexCount;
    *pin0 = *pin1 = 0;
    for (uint32_t i = 0; i < n; ++i)
    {
        Vec3 p = Position(mesh.vertex, out->global[i]) - origin;
        out->uv[2 * i] = Dot(p, bu);
        out->uv[2 * i + 1] = Dot(p, bv);
        *pin0 = out->uv[2 * i] < out->uv[2 * *pin0] ? i : *pin0;
        *pin1 = out->uv[2 * i] > out->uv[2 * *pin1] ? i : *pin1;
    }
    if (*pin0 == *pin1)
    {
        double farthest = -1;
        for (uint32_t i = 0; i < n; ++i)
        {
            Vec3 d = Position(mesh.vertex, out->global[i]) - Position(mesh.vertex, out->global[*pin0]);
            if (Dot(d, d) > farthest)
            {
                farthest = Dot(d, d);
                *pin1 = i;
            }
        }
    }
    // A similarity taking pin0 to (0, 0) and pin1 to (their 3D distance, 0); it keeps orientation.
    double distance = Length(Position(mesh.vertex, out->global[*pin1]) - Position(mesh.vertex, out->global[*pin0]));
    double ox = out->uv[2 * *pin0], oy = out->uv[2 * *pin0 + 1];
    double dx = out->uv[2 * *pin1] - ox, dy = out->uv[2 * *pin1 + 1] - oy;
    double length2 = dx * dx + dy * dy;
    double s = length2 > 0 ? distance / length2 : 0;
    for (uint32_t i = 0; i < n; ++i)
    {
        double x = out->uv[2 * i] - ox, y = out->uv[2 * i + 1] - oy;
        out->uv[2 * i] = s * (dx * x + dy * y);
        out->uv[2 * i + 1] = s * (dx * y - dy * x);
    }
    out->uv[2 * *pin0] = out->uv[2 * *pin0 + 1] = out->uv[2 * *pin1 + 1] = 0;
    out->uv[2 * *pin1] = distance;
}

bool ConformalMapper::Solve(const uint32_t* triangles, uint32_t count, FlatChart* out, uint32_t pin0, uint32_t pin1)
{
    HermitianMatrix h;
    if (!BuildConformalMatrix(*m_Mesh, triangles, count, out->corner.Data(), out->vertexCount, &h))
        return false;
    // Stop at a residual 1e-5 of the projection's (M^-1 norm), or where what is left is far below
    // what float UVs resolve (2^-36 of the chart's size: a nearly planar chart's projection is
    // already there and takes no step), or after 50 + 5 sqrt(n) steps. That cap binds on charts of
    // more than a few thousand vertices: the conformal system has many near-null modes (maps that
    // are conformal but for the discretisation), along which the steps creep. Going on to the
    // tolerance lowers such charts' area distortion further (the 100k-triangle torus: 0.045 after
    // 50 + 4 sqrt(n) steps, 0.031 converged, at 1.4 times the steps); the cap trades the two.
    double limit = 50 + 5 * Sqrt((double)h.n);
    SolveControl control = {1e-10, out->uv[2 * pin1] * kResidualResolution, limit > 4000 ? 4000 : (uint32_t)limit};
    uint32_t steps = SolvePinned(h, out->uv.Data(), pin0, pin1, control);
    if (steps == kSolveOutOfMemory)
        return false;
    double area2 = 0, area3 = 0;
    for (uint32_t i = 0; i < count; ++i)
    {
        area2 += SignedArea(out->uv.Data(), out->corner[3 * i], out->corner[3 * i + 1], out->corner[3 * i + 2]);
        area3 += m_Mesh->area[triangles[i]];
    }
    if (area2 > 0 && area3 > 0)
    {
        double s = Sqrt(area3 / area2);
        for (uint64_t i = 0; i < 2ull * out->vertexCount; ++i)
            out->uv[i] *= s;
    }
    return true;
}

bool ConformalMapper::Flatten(const uint32_t* triangles, uint32_t count, FlatChart* out)
{
    if (!Number(triangles, count, out))
        return false;
    if (count == 1)
    {
        double corners[6];
        FlattenSingleTriangle(*m_Mesh, triangles[0], corners);
        for (uint32_t c = 0; c < 3; ++c)   // a triangle with a repeated index is degenerate: never here
        {
            out->uv[2 * out->corner[c]] = corners[2 * c];
            out->uv[2 * out->corner[c] + 1] = corners[2 * c + 1];
        }
        return true;
    }
    uint32_t pin0, pin1;
    Project(triangles, count, out, &pin0, &pin1);
    return Solve(triangles, count, out, pin0, pin1);
}

void FlattenSingleTriangle(const ChartMesh& mesh, uint32_t t, double* uv)
{
    const uint32_t* v = mesh.tri + 3 * t;
    Vec3 p0 = Position(mesh.vertex, v[0]);
    Vec3 a = Position(mesh.vertex, v[1]) - p0, b = Position(mesh.vertex, v[2]) - p0;
    double length = Length(a);
    uv[0] = uv[1] = uv[3] = 0;
    uv[2] = length;
    uv[4] = length > 0 ? Dot(a, b) / length : 0;
    uv[5] = length > 0 ? Length(Cross(a, b)) / length : 0;
}
