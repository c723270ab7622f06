// What the Qt tests share: a scripted stand-in for the person, a window object that records
// its messages, and a folder with a scenario and settings for the simulated library.
#pragma once

#include <QString>
#include <QStringList>
#include <QTemporaryDir>

#include <algorithm>
#include <deque>
#include <string>
#include <vector>

#include "ui/Window.h"
#include "ui/qt/Answerer.h"

namespace qt_test {

// Answers from queues given in advance and records every question and file dialog; with
// nothing queued a question is answered No and a file dialog cancelled (null path).
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
        QString chosen;
    };

    void QueueAnswer(bool yes) { answers_.push_back(yes); }
    void QueueFile(const QString& path) { files_.push_back(path); }

    bool AskYesNo(QWidget* owner, const QString& caption, const QString& text) override
    {
        questions.push_back({owner, caption, text, Next(answers_)});
        return questions.back().answer;
    }
    void ShowMessage(QWidget*, const QString&, const QString&) override {}
    QString ChooseFile(QWidget* owner, FileDialogKind kind, const QString& initialName,
                       const QStringList& filters) override
    {
        fileDialogs.push_back({owner, kind, initialName, filters, Next(files_)});
        return fileDialogs.back().chosen;
    }

    std::vector<Asked> questions;
    std::vector<FileDialog> fileDialogs;

private:
    template <class T> static T Next(std::deque<T>& queue)
    {
        if (queue.empty())
            return T();
        T next = queue.front();
        queue.pop_front();
        return next;
    }

    std::deque<bool> answers_;
    std::deque<QString> files_;
};

// Records every message it receives and every one handed back undelivered.
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
    int count(ui::Message message) const
    {
        return int(std::count_if(received.begin(), received.end(),
                                 [message](const Received& r) { return r.message == message; }));
    }

    std::vector<Received> received;
    std::vector<Received> undelivered;
};

// A folder with the scenario (set as TESSEL_SIM) and a harbor.ini that loads the simulated
// library; the dialog's command line names a program in it, so the settings are found.
class SimFolder {
public:
    SimFolder(const std::string& scenario, const std::string& ports,
              const std::string& options = "");

    bool isValid() const { return dir_.isValid(); }
    QString filePath(const QString& name) const { return dir_.filePath(name); }
    std::string commandLine() const { return '"' + filePath("harbor").toStdString() + '"'; }
    QString writeFile(const QString& name, const QByteArray& bytes) const;

private:
    QTemporaryDir dir_;
};

inline constexpr const char* kFastLink = "link-time = 0\n";

// The simulator's shipped test scenario: no link time, an Onyx2 brick behind a USB tower
// and a serial one.
std::string ShippedTestScenario();

// A program object of count sound commands; downloaded as BIN source it needs no translation.
std::string SoundProgram(int count);

QByteArray ReadAll(const QString& path);

} // namespace qt_test
