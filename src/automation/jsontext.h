#pragma once

#include <QByteArray>
#include <QByteArrayView>
#include <QCborValue>
#include <QString>
#include <optional>

namespace automation {

/// Protocol JSON text to and from QCborValue, through the core JSON module. QCborValue keeps
/// what the protocol needs and QJsonDocument loses: integers apart from numbers with a
/// fraction or exponent ("2" is an integer, "2.0" a Double), and the order of object
/// members as written.
class JsonText {
public:
    /// Parses one JSON value (RFC 8259, UTF-8, surrounding white space allowed). Returns
    /// nothing and a message with the line and column when the text is not JSON.
    static std::optional<QCborValue> parse(QByteArrayView text, QString* error = nullptr);

    /// Compact JSON text without line breaks. Doubles always carry a fraction or exponent
    /// ("2.0"), so they read back as numbers with a fraction; non-finite doubles, which JSON
    /// cannot hold, are written as null.
    static QByteArray serialize(const QCborValue& value);
};

} // namespace automation
