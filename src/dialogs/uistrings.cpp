#include "dialogs/uistrings.h"

#include "core/comerror.h"
#include "engine/moxglobals.h"

#include <array>

namespace dialogs {

namespace {

constexpr int16_t FirstId = 1;
constexpr int16_t LastId = 5;
constexpr int16_t English = 3;
constexpr int16_t Latvian = 5;

struct Row {
    int16_t id;
    const char16_t* english;
    const char16_t* estonian;
    const char16_t* latvian;
};

// "&" marks the access key of a button caption. An empty translation falls back to
// the English text of its row.
constexpr std::array<Row, 5> Rows { {
    { UIString::OK, u"&OK", u"&OK", u"&OK" },
    { UIString::Cancel, u"&Cancel", u"Ka&tkesta", u"Atcelt" },
    { UIString::Calendar, u"Calendar", u"Kalender", u"Kalend\u0101rs" },
    { UIString::Today, u"Today: ", u"T\u00e4na: ", u"\u0160odien: " },
    { UIString::EnterParameterValues, u"Enter parameter values",
        u"Sisesta parameetrite v\u00e4\u00e4rtused", u"" },
} };

using Table = std::array<std::array<QString, Latvian - English + 1>, LastId + 1>;

const Table& table()
{
    static const Table filled = [] {
        Table t;
        for (const Row& row : Rows) {
            const QString english = QString::fromUtf16(row.english);
            const auto orEnglish = [&english](const char16_t* text) {
                const QString translated = QString::fromUtf16(text);
                return translated.isEmpty() ? english : translated;
            };
            t[row.id] = { english, orEnglish(row.estonian), orEnglish(row.latvian) };
        }
        return t;
    }();
    return filled;
}

QString argumentText(const core::Variant& argument)
{
    // Null and objects join as nothing rather than failing the whole caption.
    try {
        return argument.toText();
    } catch (const core::ComError&) {
        return {};
    }
}

} // namespace

QString GetUIString(int16_t id, const std::vector<core::Variant>& args)
{
    if (id < FirstId || id > LastId)
        return {};
    const auto& row = table()[id];
    const int16_t language = engine::gLanguage;
    QString text = (language >= English && language <= Latvian) ? row[language - English] : row[0];
    if (text.isEmpty())
        text = row[0];
    if (args.empty())
        return text;
    return FillUIString(text, args);
}

QString FillUIString(const QString& text, const std::vector<core::Variant>& args)
{
    if (args.empty())
        return text;
    const QStringList parts
        = text.split(QStringLiteral("%s"), Qt::KeepEmptyParts, Qt::CaseInsensitive);
    const size_t count = std::max(static_cast<size_t>(parts.size()), args.size());
    QString result;
    for (size_t i = 0; i < count; ++i) {
        if (i < static_cast<size_t>(parts.size()))
            result += parts.at(static_cast<qsizetype>(i));
        if (i < args.size())
            result += argumentText(args[i]);
    }
    return result;
}

} // namespace dialogs
