#include "reportrt/mail/mailerror.h"

namespace reportrt::mail {

MailError::MailError(Kind kind, QString description)
    : m_kind(kind)
    , m_description(std::move(description))
    , m_what(m_description.toStdString())
{ }

} // namespace reportrt::mail
