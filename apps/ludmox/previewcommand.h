#pragma once

#include <QStringList>

/// `ludmox preview`: shows a report in the component's preview window, as a host does through
/// clsMoxViewer115, and returns once the user closes the window. `arguments` are the
/// process's arguments. Returns the exit code: 0 after the window was closed, 1 when the
/// report could not be shown, 2 for a usage error or when there is no display.
int previewCommand(const QStringList& arguments);
