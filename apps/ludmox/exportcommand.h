#pragma once

#include <QStringList>

/// `ludmox export`: writes reports as PDF, Excel or HTML files through the report object,
/// as a host does. `arguments` are the process's arguments. Returns the exit code: 0 when
/// every report was written, 1 when one failed, 2 for a usage error.
int exportCommand(const QStringList& arguments);
