#pragma once
// For tests and the benchmark: an OBJ file read the way LoadFromObj stands for, with the C
// library's own formatted input: fgets into a 1,024-byte buffer, then sscanf with "v %f %f %f",
// "vt %f %f" and "f %u/%u/%*u %u/%u/%*u %u/%u/%*u" (a face counts when all six numbers match).
// The caller sets the floating-point state it wants the numbers read in.

#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

struct ObjScanfReference
{
    std::vector<float> positions;   // 3 a vertex
    std::vector<uint32_t> tri;      // 3 zero-based vertex numbers a triangle
    std::vector<float> cornerUVs;   // 6 a triangle
};

// False when the file cannot be opened or a face names a UV that the file does not have.
inline bool ReadObjWithScanf(const std::string& path, ObjScanfReference* obj)
{
    FILE* f = std::fopen(path.c_str(), "rt");
    if (!f)
        return false;
    std::vector<float> uvs;
    std::vector<uint32_t> cornerUV;
    char line[1024];
    while (std::fgets(line, sizeof line, f))
    {
        float a = 0, b = 0, c = 0;
        uint32_t v[3], t[3];
        if (line[0] == 'v' && line[1] == ' ')
        {
            std::sscanf(line, "v %f %f %f", &a, &b, &c);
            obj->positions.insert(obj->positions.end(), {a, b, c});
        }
        else if (line[0] == 'v' && line[1] == 't' && line[2] == ' ')
        {
            std::sscanf(line, "vt %f %f", &a, &b);
            uvs.insert(uvs.end(), {a, b});
        }
        else if (line[0] == 'f' && line[1] == ' ' &&
                 std::sscanf(line, "f %u/%u/%*u %u/%u/%*u %u/%u/%*u", &v[0], &t[0], &v[1], &t[1], &v[2], &t[2]) == 6)
            for (int k = 0; k < 3; ++k)
            {
                obj->tri.push_back(v[k] - 1);
                cornerUV.push_back(t[k] - 1);
            }
    }
    std::fclose(f);
    for (uint32_t k : cornerUV)
    {
        if (k >= uvs.size() / 2)
            return false;
        obj->cornerUVs.insert(obj->cornerUVs.end(), {uvs[2 * (size_t)k], uvs[2 * (size_t)k + 1]});
    }
    return true;
}
