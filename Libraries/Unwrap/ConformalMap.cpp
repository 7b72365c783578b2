#include "ConformalMap.h"

#include "HermitianMatrix.h"
#include "WinImports.h"

namespace
{
    const double kMaxCotangent = 1e4;   // slivers: keeps the matrix finite and the solver steady

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

    // Incomplete Cholesky factor (no fill) of H seen as the complex Hermitian matrix L + iB acting
    // on z = u + iv: H ~ F F^H with F lower triangular on the pattern of H. Rows and columns of the
    // pins are left out (identity). A pivot that would not be positive falls back to the diagonal
    // of H (obtuse triangles make H no M-matrix, so this can happen).
    struct Preconditioner
    {
        const HermitianMatrix* h = nullptr;
        Scratch<double> re, im, pivot;   // re/im aligned with h->entries (lower part used)
        uint32_t pin0 = 0, pin1 = 0;
        // The factor's strictly lower part packed row by row for the solves: (re, im) pairs.
        Scratch<uint32_t> lowerStart, lowerColumn;
        Scratch<double> lower, inversePivot;

        bool Pack()
        {
            uint32_t n = h->n, count = 0;
            for (uint32_t i = 0; i < n; ++i)
                for (uint32_t a = h->rowStart[i]; a < h->rowStart[i + 1] && h->entries[a].column < i; ++a)
                    ++count;
            if (!lowerStart.Allocate(n + 1ull) || !lowerColumn.Allocate(count + 1ull) || !lower.Allocate(2ull * count + 2) ||
                !inversePivot.Allocate(n + 1ull))
                return false;
            uint32_t k = 0;
            for (uint32_t i = 0; i < n; ++i)
            {
                lowerStart[i] = k;
                inversePivot[i] = 1 / pivot[i];
                for (uint32_t a = h->rowStart[i]; a < h->rowStart[i + 1] && h->entries[a].column < i; ++a, ++k)
                {
                    lowerColumn[k] = h->entries[a].column;
                    lower[2ull * k] = re[a];
                    lower[2ull * k + 1] = im[a];
                }
            }
            lowerStart[n] = k;
            re.Release();   // the solves read only the packed factor
            im.Release();
            pivot.Release();
            return true;
        }

        bool Pinned(uint32_t i) const { return i == pin0 || i == pin1; }

        bool Factor(const HermitianMatrix& matrix, uint32_t p0, uint32_t p1)
        {
            h = &matrix;
            pin0 = p0;
            pin1 = p1;
            uint32_t n = matrix.n;
            if (!re.Allocate(matrix.rowStart[n] + 1ull) || !im.Allocate(matrix.rowStart[n] + 1ull) || !pivot.Allocate(n))
                return false;
            for (uint32_t i = 0; i < n; ++i)
            {
                uint32_t begin = matrix.rowStart[i], end = matrix.rowStart[i + 1];
                double sum = 0;
                for (uint32_t a = begin; a < end && matrix.entries[a].column < i; ++a)
                {
                    uint32_t k = matrix.entries[a].column;
                    re[a] = im[a] = 0;
                    if (Pinned(i) || Pinned(k))
                        continue;
                    double sr = matrix.entries[a].laplace, si = matrix.entries[a].area;
                    // minus sum over j < k of F_ij conj(F_kj): merge the two rows' lower parts
                    uint32_t x = begin, y = matrix.rowStart[k];
                    while (x < a && y < matrix.rowStart[k + 1] && matrix.entries[y].column < k)
                    {
                        uint32_t cx = matrix.entries[x].column, cy = matrix.entries[y].column;
                        if (cx < cy)
                            ++x;
                        else if (cy < cx)
                            ++y;
                        else
                        {
                            sr -= re[x] * re[y] + im[x] * im[y];
                            si -= im[x] * re[y] - re[x] * im[y];
                            ++x;
                            ++y;
                        }
                    }
                    re[a] = sr / pivot[k];
                    im[a] = si / pivot[k];
                    sum += re[a] * re[a] + im[a] * im[a];
                }
                double d = matrix.diag[i] - sum;
                pivot[i] = Pinned(i) ? 1 : Sqrt(d > 1e-8 * matrix.diag[i] ? d : (matrix.diag[i] > 0 ? matrix.diag[i] : 1));
            }
            return Pack();
        }

        // z = (F F^H)^-1 r, both interleaved (u, v); z may not alias r.
        void Apply(const double* r, double* z) const
        {
            uint32_t n = h->n;
            for (uint32_t i = 0; i < n; ++i)   // F y = r
            {
                double yr = r[2 * i], yi = r[2 * i + 1];
                for (uint32_t a = lowerStart[i]; a < lowerStart[i + 1]; ++a)
                {
                    uint32_t k = lowerColumn[a];
                    double fr = lower[2ull * a], fi = lower[2ull * a + 1];
                    yr -= fr * z[2 * k] - fi * z[2 * k + 1];
                    yi -= fr * z[2 * k + 1] + fi * z[2 * k];
                }
                z[2 * i] = yr * inversePivot[i];
                z[2 * i + 1] = yi * inversePivot[i];
            }
            for (uint32_t i = n; i-- > 0;)   // F^H z = y, column by column
            {
                double zr = z[2 * i] * inversePivot[i], zi = z[2 * i + 1] * inversePivot[i];
                z[2 * i] = zr;
                z[2 * i + 1] = zi;
                for (uint32_t a = lowerStart[i]; a < lowerStart[i + 1]; ++a)
                {
                    uint32_t k = lowerColumn[a];
                    double fr = lower[2ull * a], fi = lower[2ull * a + 1];
                    z[2 * k] -= fr * zr + fi * zi;
                    z[2 * k + 1] -= fr * zi - fi * zr;
                }
            }
            if (n)
                z[2 * pin0] = z[2 * pin0 + 1] = z[2 * pin1] = z[2 * pin1 + 1] = 0;
        }
    };

    double DotN(const double* a, const double* b, uint64_t n)
    {
        double sum = 0;
        for (uint64_t i = 0; i < n; ++i)
            sum += a[i] * b[i];
        return sum;
    }

    // Preconditioned conjugate gradients on H x = 0 with the four coordinates of the pins held.
    bool ConjugateGradients(const HermitianMatrix& h, double* x, uint32_t pin0, uint32_t pin1)
    {
        uint64_t m = 2ull * h.n;
        Scratch<double> r, z, p, q;
        Preconditioner incomplete;
        if (!r.Allocate(m) || !z.Allocate(m) || !p.Allocate(m) || !q.Allocate(m) || !incomplete.Factor(h, pin0, pin1))
            return false;
        auto clearPins = [pin0, pin1](double* a) { a[2 * pin0] = a[2 * pin0 + 1] = a[2 * pin1] = a[2 * pin1 + 1] = 0; };
        h.Multiply(x, r.Data());
        for (uint64_t i = 0; i < m; ++i)
            r[i] = -r[i];
        clearPins(r.Data());
        incomplete.Apply(r.Data(), z.Data());
        memcpy(p.Data(), z.Data(), m * sizeof(double));
        double rz = DotN(r.Data(), z.Data(), m);
        // A residual 1e-5 of the start's, within 50 + 4 sqrt(n) steps: further digits change the
        // map's distortion by less than 1e-3 and cost as much again (measured on tori and scans).
        double stop = 1e-10 * DotN(r.Data(), r.Data(), m);
        double limit = 50 + 4 * Sqrt((double)h.n);
        uint32_t maxIterations = limit > 4000 ? 4000 : (uint32_t)limit;
        for (uint32_t it = 0; it < maxIterations && rz > 0; ++it)
        {
            h.Multiply(p.Data(), q.Data());
            clearPins(q.Data());
            double pq = DotN(p.Data(), q.Data(), m);
            if (!(pq > 0))
                break;
            double alpha = rz / pq, rr = 0;   // one pass: the same sums in the same order
            for (uint64_t i = 0; i < m; ++i)
            {
                x[i] += alpha * p[i];
                r[i] -= alpha * q[i];
                rr += r[i] * r[i];
            }
            if (rr <= stop)
                break;
            incomplete.Apply(r.Data(), z.Data());
            double next = DotN(r.Data(), z.Data(), m);
            double beta = next / rz;
            rz = next;
            for (uint64_t i = 0; i < m; ++i)
                p[i] = z[i] + beta * p[i];
        }
        return true;
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
    if (!ConjugateGradients(h, out->uv.Data(), pin0, pin1))
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
