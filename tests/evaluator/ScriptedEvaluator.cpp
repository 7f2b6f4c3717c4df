#include "ScriptedEvaluator.h"

#include <algorithm>
#include <fstream>
#include <random>
#include <span>

#include <gtest/gtest.h>

namespace scripted {

void TestDeformer::setArguments(unsigned /*pass*/, vyra::KernelArguments& arguments)
{
    if (onArguments)
        onArguments();
    if (function != "full")
        return;
    arguments.constant(weights);
    arguments.frame(std::span<const float>(numbers));
    arguments.value(amount);
}

void TestDeformer::deform(const vyra::MeshGeometry& /*geometry*/, vyra::Surface& surface) const
{
    if (onDeform)
        onDeform();
    for (vyra::Vector3& position : surface.positions)
        position.x += amount;
}

EvaluatorTest::EvaluatorTest()
    : kernels(std::filesystem::path(testing::TempDir()) /
              ("vyra-evaluator-" + std::to_string(std::random_device()())))
{
    std::filesystem::create_directories(kernels);
    writeKernels("test.cl", kKernelText);
    settings.kernelDirectories = {kernels.string()};
    settings.finishRenderer = [] {
        const InsideRuntime notTheEvaluators;
        runtime().log("finishRenderer()");
    };
}

EvaluatorTest::~EvaluatorTest()
{
    std::filesystem::remove_all(kernels);
}

void EvaluatorTest::TearDown()
{
    evaluator.reset();
    EXPECT_EQ(runtime().acquired(), Lines{});
    EXPECT_EQ(leftOver(), expectedLeft);
    expectLeft(objectsSinceStart());
    ScriptedTest::TearDown();
}

Lines EvaluatorTest::objectsSinceStart() const
{
    Lines lines = runtime().balance();
    std::erase_if(lines, [this](const std::string& line) {
        return std::ranges::count(leftByStart, line) > 0;
    });
    return lines;
}

Lines EvaluatorTest::leftOver()
{
    evaluator.reset();
    if (TopenCLInfo::isValid()) { // drops the event of the last release
        manager().PreEvaluate(em::Id(0));
        manager().PostEvaluate(em::Id(0));
    }
    Lines lines = objectsSinceStart();
    for (const char* kept : {"event", "sync"}) {
        const auto first = std::ranges::find_if(
            lines, [kept](const std::string& line) { return line.starts_with(kept); });
        if (first != lines.end())
            lines.erase(first);
    }
    return lines;
}

void EvaluatorTest::startIn(int graphicsToCL, int clToGraphics)
{
    startInModes(graphicsToCL, clToGraphics);
    info().setMinimumBufferSize(kSmallest);
    makeEvaluator();
    calls();
}

void EvaluatorTest::makeEvaluator()
{
    evaluator.reset();
    evaluator = std::make_unique<vyra::Evaluator>(settings);
    fMeshes = 0;
}

std::shared_ptr<vyra::MeshGeometry> EvaluatorTest::grid(unsigned vertices, std::string name)
{
    auto geometry = std::make_shared<vyra::MeshGeometry>();
    geometry->name = std::move(name);
    for (unsigned i = 0; i < vertices; ++i) {
        const unsigned column = i / 2;
        geometry->rest.positions.push_back({static_cast<float>(column), static_cast<float>(i % 2)});
        geometry->rest.normals.push_back({0, 0, 1});
        if (i >= 2)
            geometry->triangles.insert(geometry->triangles.end(), {i - 2, i - 1, i});
    }
    return geometry;
}

vyra::DeformableMesh& EvaluatorTest::addMesh(unsigned vertices)
{
    return addMesh(grid(vertices, std::string(1, static_cast<char>('a' + fMeshes))));
}

vyra::DeformableMesh& EvaluatorTest::addMesh(std::shared_ptr<const vyra::MeshGeometry> geometry)
{
    const unsigned first = 2 * fMeshes++ + 1;
    return evaluator->createMesh(std::move(geometry), {.positions = first, .normals = first + 1});
}

vyra::DeformableMesh& EvaluatorTest::addChain()
{
    vyra::DeformableMesh& mesh = addMesh();
    mesh.add<TestDeformer>("skin", "full");
    mesh.add<TestDeformer>("twist");
    return mesh;
}

void EvaluatorTest::frame()
{
    evaluate();
    evaluator->waitUntilDrawable();
    evaluator->renderingComplete();
}

Lines EvaluatorTest::callsOfEvaluation()
{
    calls();
    evaluate();
    return calls();
}

void EvaluatorTest::writeKernels(const std::string& file, const std::string& text) const
{
    std::ofstream(kernels / file) << text;
}

} // namespace scripted
