#include "Support.h"

#include <QFile>

#include <cstdlib>

namespace qt_test {

SimFolder::SimFolder(const std::string& scenario, const std::string& ports,
                     const std::string& options)
{
    const QString scenarioPath = writeFile("scenario.sim", scenario.c_str());
    ::setenv("TESSEL_SIM", scenarioPath.toLocal8Bit().constData(), 1);
    const std::string settings = "[PATHS]\nDLL=" HARBOR_SIM_DIR "/\n[DEBUG]\nMEMFILES=TRUE\n"
                                 "[PORTS]\n" +
                                 ports + "\n[OPTIONS]\n" + options + "\n";
    writeFile("harbor.ini", settings.c_str());
}

QString SimFolder::writeFile(const QString& name, const QByteArray& bytes) const
{
    QFile file(filePath(name));
    if (file.open(QIODevice::WriteOnly | QIODevice::Truncate))
        file.write(bytes);
    return file.fileName();
}

std::string ShippedTestScenario()
{
    return ReadAll(HARBOR_SOURCE_DIR "/resources/scenarios/tests.sim").toStdString();
}

std::string SoundProgram(int count)
{
    std::string text = "tobj 1 6 program\ntask 0\n";
    for (int i = 0; i < count; ++i)
        text += "cmd 20 04\n";
    return text + "end\n";
}

QByteArray ReadAll(const QString& path)
{
    QFile file(path);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

} // namespace qt_test
