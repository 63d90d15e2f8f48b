#include "dialogs/dialogslogging_p.h"

namespace dialogs {
Q_LOGGING_CATEGORY(lcDialogs, "ludmox.dialogs")
}
