// End-to-end tests of chartbake-mesh on glTF: the real binary with the bundled libraries, on
// files the tests build, checked with the Khronos validator and attribute by attribute.
#include "Editor/Tools/Unwrap/source/MeshTool/MeshToolTestSupport.h"
#include "Runtime/Testing/Testing.h"

using namespace MeshToolTest;

namespace
{
    // The smallest valid PNG (1x1, grey), for the texture the scene refers to.
    std::string TinyPng()
    {
        static const unsigned char bytes[] = {
            0x89, 0x50, 0x4E, 0x47, 0x0D, 0x0A, 0x1A, 0x0A, 0x00, 0x00, 0x00, 0x0D, 0x49, 0x48, 0x44, 0x52, 0x00, 0x00,
            0x00, 0x01, 0x00, 0x00, 0x00, 0x01, 0x08, 0x00, 0x00, 0x00, 0x00, 0x3A, 0x7E, 0x9B, 0x55, 0x00, 0x00, 0x00,
            0x0A, 0x49, 0x44, 0x41, 0x54, 0x78, 0x9C, 0x63, 0x68, 0x00, 0x00, 0x00, 0x82, 0x00, 0x81, 0x4C, 0x17, 0xD7,
            0xDF, 0x00, 0x00, 0x00, 0x00, 0x49, 0x45, 0x4E, 0x44, 0xAE, 0x42, 0x60, 0x82};
        return std::string(reinterpret_cast<const char*>(bytes), sizeof bytes);
    }

    // Two meshes (cubes side by side, each with normals, UVs and a material), a points primitive
    // that must stay as it is, an animation whose accessors must keep their numbers, an external
    // texture image and extras.
    // `embeddedImage`: the texture lives in the buffer (as in most .glb files), else in albedo.png.
    GltfBuilder TwoCubeScene(bool embeddedImage = false)
    {
        GltfBuilder b;
        tinygltf::Model& m = b.model;
        for (int i = 0; i < 2; ++i)
        {
            CubeData cube = MakeCube(i * 3.0f);
            tinygltf::Primitive primitive;
            primitive.mode = TINYGLTF_MODE_TRIANGLES;
            primitive.attributes["POSITION"] = b.Vec3(cube.positions, true);
            primitive.attributes["NORMAL"] = b.Vec3(cube.normals);
            primitive.attributes["TEXCOORD_0"] = b.Vec2(cube.uvs);
            primitive.indices = b.Indices(cube.indices);
            primitive.material = 0;
            tinygltf::Mesh mesh;
            mesh.name = i == 0 ? "left" : "right";
            mesh.primitives.push_back(primitive);
            m.meshes.push_back(mesh);
            tinygltf::Node node;
            node.name = mesh.name + "Node";
            node.mesh = i;
            m.nodes.push_back(node);
        }
        // A morph target on the left cube pushing out its -x face (vertices 0-3, whose order the
        // output changes), each corner by its own amount, stored sparsely over zeros.
        {
            const uint16_t moved[4] = {0, 1, 2, 3};
            const float lift[12] = {-0.1f, 0, 0, -0.2f, 0, 0, -0.3f, 0, 0, -0.4f, 0, 0};
            tinygltf::Accessor target;
            target.type = TINYGLTF_TYPE_VEC3;
            target.componentType = TINYGLTF_COMPONENT_TYPE_FLOAT;
            target.count = 24;
            target.bufferView = -1;
            target.minValues = {-0.4f, 0, 0};
            target.maxValues = {0, 0, 0};
            target.sparse.isSparse = true;
            target.sparse.count = 4;
            target.sparse.indices.bufferView = b.View(moved, sizeof moved);
            target.sparse.indices.byteOffset = 0;
            target.sparse.indices.componentType = TINYGLTF_COMPONENT_TYPE_UNSIGNED_SHORT;
            target.sparse.values.bufferView = b.View(lift, sizeof lift);
            target.sparse.values.byteOffset = 0;
            m.accessors.push_back(target);
            m.meshes[0].primitives[0].targets.push_back({{"POSITION", (int)m.accessors.size() - 1}});
            m.meshes[0].weights = {0.25};
        }

        tinygltf::Primitive points;
        points.mode = TINYGLTF_MODE_POINTS;
        points.attributes["POSITION"] = b.Vec3({0, 5, 0, 1, 5, 0}, true);
        m.meshes[1].primitives.push_back(points);

        float times[2] = {0, 1};
        float rotations[8] = {0, 0, 0, 1, 0, 0.7071068f, 0, 0.7071068f};
        tinygltf::AnimationSampler sampler;
        sampler.input = b.Add(times, 2, TINYGLTF_TYPE_SCALAR, TINYGLTF_COMPONENT_TYPE_FLOAT, 0, true);
        sampler.output = b.Add(rotations, 2, TINYGLTF_TYPE_VEC4, TINYGLTF_COMPONENT_TYPE_FLOAT, 0);
        tinygltf::Animation animation;
        animation.name = "spin";
        animation.samplers.push_back(sampler);
        tinygltf::AnimationChannel channel;
        channel.sampler = 0;
        channel.target_node = 1;
        channel.target_path = "rotation";
        animation.channels.push_back(channel);
        m.animations.push_back(animation);

        tinygltf::Image image;
        if (embeddedImage)
        {
            std::string png = TinyPng();
            image.bufferView = b.View(png.data(), png.size());
            image.mimeType = "image/png";
        }
        else
            image.uri = "albedo.png";
        m.images.push_back(image);
        tinygltf::Texture texture;
        texture.source = 0;
        m.textures.push_back(texture);
        tinygltf::Material material;
        material.name = "painted";
        material.pbrMetallicRoughness.baseColorTexture.index = 0;
        material.pbrMetallicRoughness.baseColorFactor = {0.5, 0.25, 1, 1};
        tinygltf::Value::Object extras;
        extras["note"] = tinygltf::Value(std::string("kept"));
        material.extras = tinygltf::Value(extras);
        m.materials.push_back(material);

        tinygltf::Scene scene;
        scene.nodes = {0, 1};
        m.scenes.push_back(scene);
        m.defaultScene = 0;
        return b;
    }
}

INTEGRATION_TEST_SUITE(ChartBakeMeshGltf)
{
    TEST_FIXTURE(MeshToolFixture, TwoMeshGltf_KeepsEverythingAndAddsAValidTexcoord1)
    {
        GltfBuilder input = TwoCubeScene();
        Write("scene.gltf", input.Bytes(false));
        Write("albedo.png", TinyPng());
        std::filesystem::create_directory(PathOf("out"));
        CHECK_EQUAL(0, Validate("scene.gltf").exitStatus);   // the input itself is valid

        Testing::ChildResult r = Run({"scene.gltf", "out/scene.gltf"});
        CHECK_EQUAL("", r.err);
        CHECK_EQUAL(0, r.exitStatus);
        CHECK(Contains(r.out, "24 triangles"));
        Testing::ChildResult verdict = Validate("out/scene.gltf");
        CHECK_EQUAL(0, verdict.exitStatus);
        CHECK(Contains(verdict.out, "errors 0"));

        GltfDocument output, original;
        if (!LoadOutput("out/scene.gltf", &output) || !LoadOutput("scene.gltf", &original))
        {
            CHECK(false);
            return;
        }
        CHECK_EQUAL("", CompareLightmapped(original.model, output.model));
        const tinygltf::Model& m = output.model;
        CHECK_EQUAL(1u, m.buffers.size());
        CHECK(m.meshes[0].primitives[0].attributes.count("TEXCOORD_1"));
        // Names, materials, extras, the image (now named from the output's folder) and the
        // animation's accessors survive.
        CHECK_EQUAL("leftNode", m.nodes[0].name);
        CHECK_EQUAL("painted", m.materials[0].name);
        CHECK_EQUAL(0.25, m.materials[0].pbrMetallicRoughness.baseColorFactor[1]);
        CHECK_EQUAL("kept", m.materials[0].extras.Get("note").Get<std::string>());
        CHECK_EQUAL("../albedo.png", m.images[0].uri);
        CHECK_EQUAL(1u, m.animations.size());
        const tinygltf::AnimationSampler& sampler = m.animations[0].samplers[0];
        CHECK(Elements(original.model, original.model.animations[0].samplers[0].output) == Elements(m, sampler.output));
        CHECK(Elements(original.model, original.model.animations[0].samplers[0].input) == Elements(m, sampler.input));
    }

    TEST_FIXTURE(MeshToolFixture, SharedAtlas_MeshesSplitTheSquare_PerMeshEachFillsItsOwn)
    {
        Write("scene.glb", TwoCubeScene().Bytes(true));
        Write("albedo.png", TinyPng());
        CHECK_EQUAL("", Run({"scene.glb", "shared.glb"}).err);
        CHECK_EQUAL("", Run({"--per-mesh", "scene.glb", "own.glb"}).err);
        GltfDocument shared, own;
        if (!LoadOutput("shared.glb", &shared) || !LoadOutput("own.glb", &own))
        {
            CHECK(false);
            return;
        }
        double sharedArea[2], ownArea[2];
        for (int i = 0; i < 2; ++i)
        {
            sharedArea[i] = LightmapArea(shared.model, shared.model.meshes[(size_t)i].primitives[0], "TEXCOORD_1");
            ownArea[i] = LightmapArea(own.model, own.model.meshes[(size_t)i].primitives[0], "TEXCOORD_1");
        }
        // Equal cubes: one density, so equal shares; alone, each covers about twice as much.
        CHECK_CLOSE(sharedArea[0], sharedArea[1], 0.02 * sharedArea[0]);
        CHECK(sharedArea[0] + sharedArea[1] <= 1.0);
        CHECK(ownArea[0] > 1.5 * sharedArea[0]);
        CHECK_EQUAL("errors 0 warnings 0\n", Validate("own.glb").out);
    }

    TEST_FIXTURE(MeshToolFixture, Glb_EmbeddedImage_StaysInTheBuffer)
    {
        Write("scene.glb", TwoCubeScene(true).Bytes(true));
        CHECK_EQUAL(0, Run({"scene.glb", "out.glb"}).exitStatus);
        CHECK_EQUAL("errors 0 warnings 0\n", Validate("out.glb").out);
        GltfDocument original, output;
        if (!LoadOutput("scene.glb", &original) || !LoadOutput("out.glb", &output))
        {
            CHECK(false);
            return;
        }
        CHECK_EQUAL("", CompareLightmapped(original.model, output.model));
        const tinygltf::Image& image = output.model.images.at(0);
        CHECK(image.uri.empty());
        const tinygltf::BufferView& view = output.model.bufferViews.at((size_t)image.bufferView);
        const std::vector<unsigned char>& buffer = output.model.buffers.at(0).data;
        CHECK_EQUAL(TinyPng(), std::string(buffer.begin() + (long)view.byteOffset,
                                           buffer.begin() + (long)(view.byteOffset + view.byteLength)));
    }

    TEST_FIXTURE(MeshToolFixture, Glb_StripFanAndUnindexedPrimitives_BecomeValidTriangleLists)
    {
        GltfBuilder b;
        // A strip of 4 triangles, a fan of 3 and 2 triangles without indices, one mesh each.
        std::vector<float> strip = {0, 0, 0, 0, 1, 0, 1, 0, 0, 1, 1, 0, 2, 0, 0, 2, 1, 0};
        std::vector<float> fan = {0, 0, 1, 1, 0, 1, 1, 1, 1, 0, 1, 1, -1, 1, 1};
        std::vector<float> soup = {0, 0, 2, 1, 0, 2, 0, 1, 2, 1, 0, 2, 1, 1, 2, 0, 1, 2};
        int modes[3] = {TINYGLTF_MODE_TRIANGLE_STRIP, TINYGLTF_MODE_TRIANGLE_FAN, TINYGLTF_MODE_TRIANGLES};
        const std::vector<float>* data[3] = {&strip, &fan, &soup};
        for (int i = 0; i < 3; ++i)
        {
            tinygltf::Primitive primitive;
            primitive.mode = modes[i];
            primitive.attributes["POSITION"] = b.Vec3(*data[i], true);
            if (i < 2)
            {
                std::vector<uint16_t> order(data[i]->size() / 3);
                for (size_t k = 0; k < order.size(); ++k)
                    order[k] = (uint16_t)k;
                primitive.indices = b.Indices(order);
            }
            tinygltf::Mesh mesh;
            mesh.primitives.push_back(primitive);
            b.model.meshes.push_back(mesh);
            tinygltf::Node node;
            node.mesh = i;
            b.model.nodes.push_back(node);
        }
        b.model.scenes.push_back(tinygltf::Scene());
        b.model.scenes[0].nodes = {0, 1, 2};
        Write("strips.glb", b.Bytes(true));

        Testing::ChildResult r = Run({"strips.glb", "out.glb"});
        CHECK_EQUAL(0, r.exitStatus);
        CHECK(Contains(r.out, "9 triangles"));
        CHECK_EQUAL(0, Validate("out.glb").exitStatus);
        GltfDocument original, output;
        if (!LoadOutput("strips.glb", &original) || !LoadOutput("out.glb", &output))
        {
            CHECK(false);
            return;
        }
        CHECK_EQUAL("", CompareLightmapped(original.model, output.model));
        for (const tinygltf::Mesh& mesh : output.model.meshes)
        {
            CHECK_EQUAL(TINYGLTF_MODE_TRIANGLES, mesh.primitives[0].mode);
            CHECK(mesh.primitives[0].attributes.count("TEXCOORD_0"));   // none before: the first free set
        }
    }

    TEST_FIXTURE(MeshToolFixture, ExternalBuffer_ReadBesideTheFile_NeverOverwritten)
    {
        // One triangle; its buffer in tri.bin: 3 positions, 3 16-bit indices, 2 bytes of padding.
        const float positions[9] = {0, 0, 0, 1, 0, 0, 0, 1, 0};
        const uint16_t indices[4] = {0, 1, 2, 0};
        std::string bin(reinterpret_cast<const char*>(positions), sizeof positions);
        bin.append(reinterpret_cast<const char*>(indices), sizeof indices);
        Write("tri.bin", bin);
        Write("tri.gltf",
              R"({"asset": {"version": "2.0"}, "scene": 0, "scenes": [{"nodes": [0]}], "nodes": [{"mesh": 0}],
                  "meshes": [{"primitives": [{"attributes": {"POSITION": 0}, "indices": 1}]}],
                  "buffers": [{"uri": "tri.bin", "byteLength": 44}],
                  "bufferViews": [{"buffer": 0, "byteLength": 36, "target": 34962},
                                  {"buffer": 0, "byteOffset": 36, "byteLength": 6, "target": 34963}],
                  "accessors": [{"bufferView": 0, "componentType": 5126, "count": 3, "type": "VEC3",
                                 "min": [0, 0, 0], "max": [1, 1, 0]},
                                {"bufferView": 1, "componentType": 5123, "count": 3, "type": "SCALAR"}]})");
        CHECK_EQUAL("errors 0 warnings 0\n", Validate("tri.gltf").out);
        Testing::ChildResult r = Run({"tri.gltf", "tri_lightmapped.gltf"});
        CHECK_EQUAL(0, r.exitStatus);
        CHECK_EQUAL(bin, Read("tri.bin"));
        CHECK_EQUAL("errors 0 warnings 0\n", Validate("tri_lightmapped.gltf").out);

        std::filesystem::remove(PathOf("tri.bin"));
        r = Run({"tri.gltf", "again.gltf"});
        CHECK_EQUAL(1, r.exitStatus);
        CHECK(Contains(r.err, "chartbake-mesh: cannot read tri.gltf: "));
        CHECK(!Exists("again.gltf"));
    }

    TEST_FIXTURE(MeshToolFixture, Gltf_ToObj_KeepsNamesMaterialsAndNormals)
    {
        Write("scene.gltf", TwoCubeScene().Bytes(false));
        Testing::ChildResult r = Run({"scene.gltf", "scene.obj"});
        CHECK_EQUAL(0, r.exitStatus);
        std::string obj = Read("scene.obj");
        CHECK(Contains(obj, "o left\n"));
        CHECK(Contains(obj, "o right\n"));
        CHECK(Contains(obj, "usemtl painted\n"));
        CHECK(Contains(obj, "mtllib scene.mtl\n"));
        CHECK(Contains(Read("scene.mtl"), "newmtl painted\nKd 0.5 0.25 1\nmap_Kd albedo.png\n"));
        CHECK(Contains(obj, "vn 0 0 -1\n") || Contains(obj, "vn -1 0 0\n"));
    }
}
