#pragma once

#include "platform/dialogservice.h"

#include <QList>
#include <deque>
#include <variant>

namespace platform {

/// Pickers that answer from a script, for tests. Each picker call is recorded; it returns the
/// next queued answer, which must be of the picker's kind (a colour for the colour picker, a
/// path for the others). An empty queue, an answer queued with cancel() and an answer of
/// the wrong kind all cancel the picker.
class ScriptedDialogService : public DialogService {
public:
    enum class Picker { Color, OpenFile, Folder };

    /// One picker call: the arguments given, in the fields the picker has.
    struct Call {
        Picker picker = Picker::Color;
        int32_t ownerWindow = 0;
        int32_t initialColor = 0;
        QString title;
        QString filter;
        QString initialDirectory;
        QString fileName;
        int32_t flags = 0;
    };

    void answerColor(int32_t oleColor) { m_answers.emplace_back(oleColor); }
    void answerPath(const QString& path) { m_answers.emplace_back(path); }
    void cancel() { m_answers.emplace_back(std::monostate()); }

    const QList<Call>& calls() const { return m_calls; }

    std::optional<int32_t> chooseColor(int32_t ownerWindow, int32_t initialColor) override;
    std::optional<QString> openFile(const FileRequest& request) override;
    std::optional<QString> chooseFolder(
        int32_t ownerWindow, const QString& title, const QString& initialFolder) override;

private:
    using Answer = std::variant<std::monostate, int32_t, QString>;

    Answer nextAnswer();

    std::deque<Answer> m_answers;
    QList<Call> m_calls;
};

} // namespace platform
