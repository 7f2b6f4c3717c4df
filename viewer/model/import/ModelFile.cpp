#include "viewer/model/import/ModelFile.h"

#include <filesystem>

#include <QFile>

namespace viewer {
namespace {

// Folder of the sample models of Debian's package assimp-testmodels.
constexpr char kSampleModels[] = "/usr/share/assimp/models";

Failure failure(const std::string& text)
{
    return {ExitCode::kModel, text};
}

[[nodiscard]] Status checkReadable(const std::string& path)
{
    QFile file(QString::fromStdString(path));
    char first = 0;
    if (!file.open(QIODevice::ReadOnly))
        return failure("the model '" + path + "' cannot be opened: " +
                       file.errorString().toStdString() + "; check its path and its permissions");
    const qint64 count = file.read(&first, 1);
    if (count < 0)
        return failure("the model '" + path + "' cannot be read: " +
                       file.errorString().toStdString() + "; check the disk that it is on");
    if (count == 0)
        return failure("the model '" + path + "' is empty; export or copy it again");
    return {};
}

} // namespace

Result<std::string> findModelFile(const std::string& name)
{
    namespace fs = std::filesystem;
    const fs::path sample = fs::path(kSampleModels) / name;
    std::error_code error;
    std::error_code ignored;
    const fs::file_status status = fs::status(name, error);
    std::string path = name;
    if (status.type() == fs::file_type::not_found || name.empty()) {
        if (!fs::is_regular_file(sample, ignored))
            return failure("there is no model file '" + name +
                           "'; give the path of a model, or the name of a sample model of the "
                           "package assimp-testmodels such as X/Testwuson.X");
        path = sample.string();
    } else if (error) {
        return failure("the model '" + name + "' cannot be opened: " + error.message() +
                       "; check its path and its permissions");
    } else if (fs::is_directory(status)) {
        return failure("the model '" + name +
                       "' is a directory; give the path of a model file in it");
    } else if (!fs::is_regular_file(status)) {
        return failure("the model '" + name +
                       "' is not a regular file; save it to a file and give the path of that");
    }
    if (Status unreadable = checkReadable(path))
        return *unreadable;
    return path;
}

} // namespace viewer
