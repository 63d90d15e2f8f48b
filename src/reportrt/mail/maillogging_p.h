#pragma once

#include <QLoggingCategory>

// Mail: where a message went (server or outbox). Never the password or message contents.
Q_DECLARE_LOGGING_CATEGORY(lcMail)
