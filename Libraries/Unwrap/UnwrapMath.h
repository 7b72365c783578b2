// Small vector helpers for the unwrapper. Square roots are the processor's instruction: the
// imported sqrt costs a call through the host on every use.
#pragma once

struct Vec3
{
    double x, y, z;
};

inline double Sqrt(double value)
{
    double root;
    __asm__("sqrtsd %1, %0" : "=x"(root) : "x"(value));
    return root;
}

inline Vec3 operator-(const Vec3& a, const Vec3& b) { return {a.x - b.x, a.y - b.y, a.z - b.z}; }
inline Vec3 operator+(const Vec3& a, const Vec3& b) { return {a.x + b.x, a.y + b.y, a.z + b.z}; }
inline Vec3 operator*(const Vec3& a, double s) { return {a.x * s, a.y * s, a.z * s}; }
inline double Dot(const Vec3& a, const Vec3& b) { return a.x * b.x + a.y * b.y + a.z * b.z; }
inline Vec3 Cross(const Vec3& a, const Vec3& b)
{
    return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}
inline double Length(const Vec3& a) { return Sqrt(Dot(a, a)); }

// The unit vector along `a`, or (0, 0, 0) for a zero vector.
inline Vec3 Normalized(const Vec3& a)
{
    double length = Length(a);
    return length > 0 ? a * (1.0 / length) : Vec3{0, 0, 0};
}

inline Vec3 Position(const float* vertex, unsigned index)
{
    const float* p = vertex + 3 * (unsigned long long)index;
    return {p[0], p[1], p[2]};
}

// atan(x) for 0 <= x <= 1, within 2e-8 (a classic odd polynomial of degree 15).
inline double AtanUnit(double x)
{
    double s = x * x;
    return x * (0.9999993329 +
                s * (-0.3332985605 +
                     s * (0.1994653599 +
                          s * (-0.1390853351 + s * (0.0964200441 + s * (-0.0559098861 + s * (0.0218612288 - s * 0.0040540580)))))));
}

// The angle in [0, pi] whose sine and cosine are proportional to y >= 0 and x: atan2(y, x)
// without a call out of the library, which matters in the unwrapper's inner loop.
inline double AngleOf(double y, double x)
{
    const double pi = 3.14159265358979323846;
    double ax = x < 0 ? -x : x;
    if (y == 0 && ax == 0)
        return 0;
    double angle = y <= ax ? AtanUnit(y / ax) : pi / 2 - AtanUnit(ax / y);
    return x < 0 ? pi - angle : angle;
}

inline double Abs(double x) { return x < 0 ? -x : x; }
