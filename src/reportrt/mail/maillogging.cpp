#include "reportrt/mail/maillogging_p.h"

Q_LOGGING_CATEGORY(lcMail, "ludmox.reportrt.mail")
