#include "Editor/Tools/Unwrap/source/MeshTool/LayoutPng.h"

#include <png.h>

#include <algorithm>
#include <cmath>
#include <unordered_map>

namespace
{
    struct Canvas
    {
        int size;
        std::vector<uint8_t> rgb;

        explicit Canvas(int n) : size(n), rgb((size_t)n * (size_t)n * 3, 72) {}

        void Set(int x, int y, const uint8_t* colour)
        {
            if (x < 0 || y < 0 || x >= size || y >= size)
                return;
            std::copy(colour, colour + 3, &rgb[((size_t)y * (size_t)size + (size_t)x) * 3]);
        }

        // UV to pixel: u across, v up.
        double X(float u) const { return u * size; }
        double Y(float v) const { return (1.0 - v) * size; }

        void FillTriangle(const float* uv, const uint8_t* colour)
        {
            double x[3], y[3];
            for (int c = 0; c < 3; ++c)
                x[c] = X(uv[2 * c]), y[c] = Y(uv[2 * c + 1]);
            double area = (x[1] - x[0]) * (y[2] - y[0]) - (x[2] - x[0]) * (y[1] - y[0]);
            if (area == 0 || !std::isfinite(area))
                return;
            int x0 = std::max(0, (int)std::floor(std::min({x[0], x[1], x[2]})));
            int x1 = std::min(size - 1, (int)std::ceil(std::max({x[0], x[1], x[2]})));
            int y0 = std::max(0, (int)std::floor(std::min({y[0], y[1], y[2]})));
            int y1 = std::min(size - 1, (int)std::ceil(std::max({y[0], y[1], y[2]})));
            for (int py = y0; py <= y1; ++py)
                for (int px = x0; px <= x1; ++px)
                {
                    double cx = px + 0.5, cy = py + 0.5;
                    bool inside = true;
                    for (int e = 0; e < 3 && inside; ++e)
                    {
                        int a = e, b = (e + 1) % 3;
                        double edge = (x[b] - x[a]) * (cy - y[a]) - (y[b] - y[a]) * (cx - x[a]);
                        inside = area > 0 ? edge >= 0 : edge <= 0;
                    }
                    if (inside)
                        Set(px, py, colour);
                }
        }

        void Line(const float* a, const float* b, const uint8_t* colour)
        {
            double xa = X(a[0]), ya = Y(a[1]), xb = X(b[0]), yb = Y(b[1]);
            int steps = (int)std::ceil(std::max(std::fabs(xb - xa), std::fabs(yb - ya))) + 1;
            steps = std::min(steps, 4 * size);
            for (int i = 0; i <= steps; ++i)
            {
                double t = (double)i / steps;
                Set((int)std::floor(xa + (xb - xa) * t), (int)std::floor(ya + (yb - ya) * t), colour);
            }
        }
    };

    // Well separated, light hues: the golden-ratio walk around the colour wheel.
    void ChartColour(uint32_t chart, uint8_t* rgb)
    {
        double hue = std::fmod(chart * 0.618033988749895, 1.0) * 6;
        double f = hue - std::floor(hue);
        double v = 0.92, s = 0.55;
        double p = v * (1 - s), q = v * (1 - s * f), t = v * (1 - s * (1 - f));
        double r, g, b;
        switch ((int)hue % 6)
        {
            case 0: r = v, g = t, b = p; break;
            case 1: r = q, g = v, b = p; break;
            case 2: r = p, g = v, b = t; break;
            case 3: r = p, g = q, b = v; break;
            case 4: r = t, g = p, b = v; break;
            default: r = v, g = p, b = q; break;
        }
        rgb[0] = (uint8_t)(r * 255), rgb[1] = (uint8_t)(g * 255), rgb[2] = (uint8_t)(b * 255);
    }

    void AppendBytes(png_structp png, png_bytep data, png_size_t length)
    {
        static_cast<std::string*>(png_get_io_ptr(png))->append(reinterpret_cast<const char*>(data), length);
    }

    std::string EncodePng(const Canvas& canvas, std::string* out)
    {
        png_structp png = png_create_write_struct(PNG_LIBPNG_VER_STRING, nullptr, nullptr, nullptr);
        png_infop info = png ? png_create_info_struct(png) : nullptr;
        if (!info)
        {
            png_destroy_write_struct(&png, nullptr);
            return "cannot start the PNG encoder";
        }
        if (setjmp(png_jmpbuf(png)))
        {
            png_destroy_write_struct(&png, &info);
            return "the PNG encoder failed";
        }
        png_set_write_fn(png, out, AppendBytes, nullptr);
        png_set_IHDR(png, info, (png_uint_32)canvas.size, (png_uint_32)canvas.size, 8, PNG_COLOR_TYPE_RGB,
                     PNG_INTERLACE_NONE, PNG_COMPRESSION_TYPE_DEFAULT, PNG_FILTER_TYPE_DEFAULT);
        png_set_compression_level(png, 9);
        png_write_info(png, info);
        for (int y = 0; y < canvas.size; ++y)
            png_write_row(png, const_cast<png_bytep>(&canvas.rgb[(size_t)y * (size_t)canvas.size * 3]));
        png_write_end(png, nullptr);
        png_destroy_write_struct(&png, &info);
        return "";
    }
}

std::string DrawLayoutPng(const MeshScene& scene, const std::vector<CornerUVs>& uvs, const ChartStats& charts,
                          int resolution, std::string* png)
{
    Canvas canvas(resolution);
    // How often each (chart, edge) occurs: an edge seen once inside its chart is on its outline.
    std::unordered_map<uint64_t, int> edgeUses;
    auto edgeKey = [&](size_t p, uint32_t t, int c) {
        const ScenePrimitive& primitive = scene.primitives[p];
        const float* uv = &uvs[p][6 * (size_t)t];
        uint64_t a = CornerKey(&primitive.positions[3 * (size_t)primitive.indices[3 * t + (uint32_t)c]], uv + 2 * c);
        int d = (c + 1) % 3;
        uint64_t b = CornerKey(&primitive.positions[3 * (size_t)primitive.indices[3 * t + (uint32_t)d]], uv + 2 * d);
        return ((a < b ? a : b) * 31 + (a < b ? b : a)) * 131 + charts.chartOfTriangle[p][t];
    };
    for (size_t p = 0; p < scene.primitives.size(); ++p)
        for (uint32_t t = 0; t < scene.primitives[p].TriangleCount(); ++t)
        {
            uint8_t colour[3];
            ChartColour(charts.chartOfTriangle[p][t], colour);
            canvas.FillTriangle(&uvs[p][6 * (size_t)t], colour);
            for (int c = 0; c < 3; ++c)
                ++edgeUses[edgeKey(p, t, c)];
        }
    const uint8_t outline[3] = {12, 12, 16};
    for (size_t p = 0; p < scene.primitives.size(); ++p)
        for (uint32_t t = 0; t < scene.primitives[p].TriangleCount(); ++t)
            for (int c = 0; c < 3; ++c)
                if (edgeUses[edgeKey(p, t, c)] == 1)
                    canvas.Line(&uvs[p][6 * (size_t)t + 2 * (size_t)c], &uvs[p][6 * (size_t)t + 2 * (size_t)((c + 1) % 3)],
                                outline);
    return EncodePng(canvas, png);
}
