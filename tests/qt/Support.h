// What the Qt tests share: an answerer that stands in for the person, a window object that
// records its messages, and a folder with a scenario and settings for the simulated library.
#pragma once

#include <QList>
#include <QString>
#include <QStringList>
#include <QTemporaryDir>

#include <deque>
#include <string>
#include <vector>

#include "ui/Window.h"
#include "ui/qt/Answerer.h"

namespace qt_test {

// Answers from queues given in advance; records every question and file dialog.
// With nothing queued, a question is answered No and a file dialog is cancelled.
class ScriptedAnswerer final : public ui::Answerer {
public:
    struct Asked {
        QWidget* owner;
        QString caption;
        QString text;
        bool answer;
    };
    struct FileDialog {
        QWidget* owner;
        FileDialogKind kind;
        QString initialName;
        QStringList filters;
        QString chosen; // null: cancelled
    };

    void QueueAnswer(bool yes) { answers_.push_back(yes); }
    void QueueFile(const QString& path) { files_.push_back(path); }

    bool AskYesNo(QWidget* owner, const QString& caption, const QString& text) override;
    void ShowMessage(QWidget* owner, const QString& caption, const QString& text) override;
    QString ChooseFile(QWidget* owner, FileDialogKind kind, const QString& initialName,
                       const QStringList& filters) override;

    std::vector<Asked> questions;
    std::vector<FileDialog> fileDialogs;

private:
    std::deque<bool> answers_;
    std::deque<QString> files_;
};

// A window object that records every message it receives and every message handed back
// undelivered (both arrive on the window's thread).
class RecordingObject final : public ui::WindowObject {
public:
    struct Received {
        ui::Message message;
        ui::WParam wParam;
        ui::LParam lParam;
    };

    bool OnMessage(ui::Message message, ui::WParam wParam, ui::LParam lParam,
                   ui::LResult& result) override
    {
        received.push_back({message, wParam, lParam});
        result = 0;
        return true;
    }
    void OnUndelivered(ui::Message message, ui::WParam wParam, ui::LParam lParam) override
    {
        undelivered.push_back({message, wParam, lParam});
    }
    int count(ui::Message message) const;

    std::vector<Received> received;
    std::vector<Received> undelivered;
};

// A folder of its own with the simulator's scenario and a harbor.ini that loads the
// simulated library; the dialog's command line names a program in that folder, so the
// settings are found beside it.
class SimFolder {
public:
    // scenario: the scenario text; ports and options: lines of [PORTS] and [OPTIONS].
    SimFolder(const std::string& scenario, const std::string& ports,
              const std::string& options = "");

    bool isValid() const { return dir_.isValid(); }
    QString path() const { return dir_.path(); }
    QString filePath(const QString& name) const { return dir_.filePath(name); }
    std::string commandLine() const;
    QString writeFile(const QString& name, const QByteArray& bytes) const;

private:
    QTemporaryDir dir_;
};

// The scenario every test starts from: no simulated transmission time.
inline constexpr const char* kFastLink = "link-time = 0\n";

// The test scenario shipped with the simulator (zero link time, one Onyx2 brick behind a USB
// tower and a serial one).
std::string ShippedTestScenario();

// A program object with count sound commands, as translation would write it; downloaded as
// BIN source it needs no translation.
std::string SoundProgram(int count);

QByteArray ReadAll(const QString& path);

} // namespace qt_test
