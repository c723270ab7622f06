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

void ScriptedAnswerer::ShowMessage(QWidget* owner, const QString& caption, const QString& text)
{
    messages.push_back({owner, caption, text, true});
}

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

bool RecordingObject::OnMessage(ui::Message message, ui::WParam wParam, ui::LParam lParam,
                                ui::LResult& result)
{
    std::lock_guard<std::mutex> lock(mutex_);
    received_.push_back({message, wParam, lParam});
    result = 0;
    return true;
}

void RecordingObject::OnUndelivered(ui::Message message, ui::WParam wParam, ui::LParam lParam)
{
    std::lock_guard<std::mutex> lock(mutex_);
    undelivered_.push_back({message, wParam, lParam});
}

std::vector<RecordingObject::Received> RecordingObject::received() const
{
    std::lock_guard<std::mutex> lock(mutex_);
    return received_;
}

std::vector<RecordingObject::Received> RecordingObject::undelivered() const
{
    std::lock_guard<std::mutex> lock(mutex_);
    return undelivered_;
}

int RecordingObject::count(ui::Message message) const
{
    std::lock_guard<std::mutex> lock(mutex_);
    int n = 0;
    for (const Received& r : received_) {
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

std::string SimFolder::commandLine(const std::string& fileArgument) const
{
    std::string line = "\"" + filePath(QStringLiteral("harbor")).toStdString() + "\"";
    if (!fileArgument.empty())
        line += " " + fileArgument;
    return line;
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
