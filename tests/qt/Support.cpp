#include "Support.h"

#include <QFile>

#include <cstdlib>
#include <fstream>
#include <sstream>

#ifndef HARBOR_SIM_DIR
#define HARBOR_SIM_DIR ""
#endif
#ifndef HARBOR_SOURCE_DIR
#define HARBOR_SOURCE_DIR ""
#endif

namespace qt_test {

bool ScriptedAnswerer::AskYesNo(QWidget* owner, const QString& caption, const QString& text)
{
    bool yes = false;
    if (!answers_.empty()) {
        yes = answers_.front();
        answers_.pop_front();
    }
    questions.push_back({owner, caption, text, yes});
    return yes;
}

// No test reads a plain message; it only must not block.
void ScriptedAnswerer::ShowMessage(QWidget*, const QString&, const QString&) {}

QString ScriptedAnswerer::ChooseFile(QWidget* owner, FileDialogKind kind,
                                     const QString& initialName, const QStringList& filters)
{
    QString chosen;
    if (!files_.empty()) {
        chosen = files_.front();
        files_.pop_front();
    }
    fileDialogs.push_back({owner, kind, initialName, filters, chosen});
    return chosen;
}

int RecordingObject::count(ui::Message message) const
{
    int n = 0;
    for (const Received& r : received) {
        if (r.message == message)
            ++n;
    }
    return n;
}

SimFolder::SimFolder(const std::string& scenario, const std::string& ports,
                     const std::string& options)
{
    const QString scenarioPath = writeFile(QStringLiteral("scenario.sim"), scenario.c_str());
    ::setenv("TESSEL_SIM", scenarioPath.toLocal8Bit().constData(), 1);
    std::string settings = "[PATHS]\nDLL=" + std::string(HARBOR_SIM_DIR) + "/\n";
    settings += "[DEBUG]\nMEMFILES=TRUE\n";
    settings += "[PORTS]\n" + ports + "\n";
    settings += "[OPTIONS]\n" + options + "\n";
    writeFile(QStringLiteral("harbor.ini"), settings.c_str());
}

std::string SimFolder::commandLine() const
{
    return "\"" + filePath(QStringLiteral("harbor")).toStdString() + "\"";
}

QString SimFolder::writeFile(const QString& name, const QByteArray& bytes) const
{
    const QString path = filePath(name);
    QFile file(path);
    if (file.open(QIODevice::WriteOnly | QIODevice::Truncate))
        file.write(bytes);
    return path;
}

std::string ShippedTestScenario()
{
    std::ifstream in(std::string(HARBOR_SOURCE_DIR) + "/resources/scenarios/tests.sim",
                     std::ios::binary);
    std::stringstream text;
    text << in.rdbuf();
    return text.str();
}

std::string SoundProgram(int count)
{
    std::string text = "tobj 1 6 program\ntask 0\n";
    for (int i = 0; i < count; ++i)
        text += "cmd 20 04\n";
    text += "end\n";
    return text;
}

QByteArray ReadAll(const QString& path)
{
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly))
        return {};
    return file.readAll();
}

} // namespace qt_test
