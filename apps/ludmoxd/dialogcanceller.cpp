#include "dialogcanceller.h"

#include <QApplication>
#include <QDialog>
#include <QEvent>

void DialogCanceller::cancelAll()
{
    if (!m_active) {
        m_active = true;
        qApp->installEventFilter(this);
    }
    for (QWidget* widget : QApplication::topLevelWidgets()) {
        auto* dialog = qobject_cast<QDialog*>(widget);
        if (dialog && dialog->isVisible() && dialog->isModal())
            QMetaObject::invokeMethod(dialog, &QDialog::reject, Qt::QueuedConnection);
    }
}

bool DialogCanceller::eventFilter(QObject* watched, QEvent* event)
{
    if (m_active && event->type() == QEvent::Show) {
        auto* dialog = qobject_cast<QDialog*>(watched);
        // Queued: the dialog's own modal loop must be running to be ended.
        if (dialog && dialog->isModal())
            QMetaObject::invokeMethod(dialog, &QDialog::reject, Qt::QueuedConnection);
    }
    return QObject::eventFilter(watched, event);
}
