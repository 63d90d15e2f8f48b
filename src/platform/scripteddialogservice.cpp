#include "platform/scripteddialogservice.h"

namespace platform {

ScriptedDialogService::Answer ScriptedDialogService::nextAnswer()
{
    if (m_answers.empty())
        return std::monostate();
    Answer answer = m_answers.front();
    m_answers.pop_front();
    return answer;
}

std::optional<int32_t> ScriptedDialogService::chooseColor(int32_t ownerWindow, int32_t initialColor)
{
    Call call;
    call.picker = Picker::Color;
    call.ownerWindow = ownerWindow;
    call.initialColor = initialColor;
    m_calls.append(call);

    const Answer answer = nextAnswer();
    if (const int32_t* color = std::get_if<int32_t>(&answer))
        return *color;
    return std::nullopt;
}

std::optional<QString> ScriptedDialogService::openFile(const FileRequest& request)
{
    Call call;
    call.picker = Picker::OpenFile;
    call.ownerWindow = request.ownerWindow;
    call.title = request.title;
    call.filter = request.filter;
    call.initialDirectory = request.initialDirectory;
    call.fileName = request.fileName;
    call.flags = request.flags;
    m_calls.append(call);

    const Answer answer = nextAnswer();
    if (const QString* path = std::get_if<QString>(&answer))
        return *path;
    return std::nullopt;
}

std::optional<QString> ScriptedDialogService::chooseFolder(
    int32_t ownerWindow, const QString& title, const QString& initialFolder)
{
    Call call;
    call.picker = Picker::Folder;
    call.ownerWindow = ownerWindow;
    call.title = title;
    call.initialDirectory = initialFolder;
    m_calls.append(call);

    const Answer answer = nextAnswer();
    if (const QString* path = std::get_if<QString>(&answer))
        return *path;
    return std::nullopt;
}

} // namespace platform
