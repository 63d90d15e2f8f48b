#pragma once

#include <QString>

namespace reportrt::mail {

/// One mail as a host asks for it. The address lists are texts in any form
/// MailAddress::parseList accepts.
class MailRequest {
public:
    QString to;
    QString cc;
    /// Envelope recipients only: never in the sent message's header.
    QString bcc;
    QString subject;
    QString message;
    /// The file to attach; empty: no attachment.
    QString attachmentPath;
    /// The name the receiver sees; empty: the attachment file's own name.
    QString attachmentName;
};

} // namespace reportrt::mail
