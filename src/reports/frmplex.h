#pragma once

#include <QWidget>

namespace reports {

/// The empty, invisible window that owns the print dialog while a report prints behind it.
/// Made a child of the host's dialog parent window (its owner, in window-system terms), it
/// keeps the dialog above the host's window even when the host lives in another process.
class frmPlex : public QWidget {
public:
    frmPlex();
};

} // namespace reports
