#pragma once

#include <QObject>

/// Cancels the component's modal dialogs once the host has gone: those that are open, and
/// any a call still being served opens afterwards. Without it a dialog nobody can answer
/// would keep the server from ending.
class DialogCanceller : public QObject {
    Q_OBJECT
public:
    using QObject::QObject;

    /// From now on every modal dialog is cancelled as soon as it shows.
    void cancelAll();

protected:
    bool eventFilter(QObject* watched, QEvent* event) override;

private:
    bool m_active = false;
};
