#include "reportrt/output/htmlexporter.h"

#include "reportrt/exportoptions.h"
#include "reportrt/layout/layoutengine.h"
#include "reportrt/output/bandwalker.h"
#include "reportrt/output/stagedfile.h"
#include "reportrt/report.h"
#include "reportrt/reportobject.h"
#include "reportrt/section.h"

#include <QBuffer>
#include <QDir>
#include <QFileInfo>
#include <QImage>
#include <QRegularExpression>
#include <QUrl>
#include <algorithm>
#include <memory>
#include <unordered_map>
#include <vector>

namespace reportrt {

namespace {

using Kind = ObjectDefinition::Kind;
using Band = BandWalker::Band;

constexpr int edgeTolerance = 30; // twips: edges closer than this are one column edge
constexpr qsizetype flushSize = 256 * 1024;

/// Appends text escaped for HTML content and attribute values. Control characters that
/// HTML does not allow are dropped; line breaks stay (cells keep white space).
void appendEscaped(QByteArray& out, const QString& text)
{
    const QByteArray utf8 = text.toUtf8();
    for (const char c : utf8) {
        switch (c) {
        case '&':
            out += "&amp;";
            break;
        case '<':
            out += "&lt;";
            break;
        case '>':
            out += "&gt;";
            break;
        case '"':
            out += "&quot;";
            break;
        case '\'':
            out += "&#39;";
            break;
        default:
            if (static_cast<unsigned char>(c) >= 0x20 || c == '\n' || c == '\t')
                out += c;
        }
    }
}

QByteArray escaped(const QString& text)
{
    QByteArray out;
    appendEscaped(out, text);
    return out;
}

QByteArray pt(double twips)
{
    return QByteArray::number(twips / 20.0, 'f', 2) + "pt";
}

/// A colour as the report gives it ("#rrggbb"); anything else is black, so nothing from a
/// report file reaches the style sheet unchecked.
QByteArray cssColor(const QString& color)
{
    static const QRegularExpression valid(QStringLiteral("^#[0-9a-fA-F]{6}$"));
    return valid.match(color).hasMatch() ? color.toLatin1() : QByteArray("#000000");
}

QByteArray cssFamily(const QString& family)
{
    QString clean;
    for (const QChar c : family) {
        if (c.isLetterOrNumber() || c == u' ' || c == u'-' || c == u'_')
            clean += c;
    }
    return '"' + clean.toUtf8() + "\",sans-serif";
}

/// The MIME type of an image file's bytes; empty when it is none a browser shows.
QByteArray imageType(const QByteArray& bytes)
{
    if (bytes.startsWith("\x89PNG\r\n\x1a\n"))
        return "image/png";
    if (bytes.startsWith("\xff\xd8\xff"))
        return "image/jpeg";
    if (bytes.startsWith("GIF87a") || bytes.startsWith("GIF89a"))
        return "image/gif";
    return {};
}

QByteArray dataUri(const QByteArray& bytes)
{
    QByteArray type = imageType(bytes);
    if (!type.isEmpty())
        return "data:" + type + ";base64," + bytes.toBase64();
    const QImage image = QImage::fromData(bytes);
    if (image.isNull())
        return {};
    QByteArray png;
    QBuffer buffer(&png);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "PNG");
    return "data:image/png;base64," + png.toBase64();
}

QByteArray dataUri(const QImage& image)
{
    if (image.isNull())
        return {};
    QByteArray png;
    QBuffer buffer(&png);
    buffer.open(QIODevice::WriteOnly);
    image.save(&buffer, "PNG");
    return "data:image/png;base64," + png.toBase64();
}

/// One cell of a section's row: the objects it shows and its opening tag.
struct Cell {
    std::vector<const ReportObject*> objects;
    QByteArray open; // "<td ...>"
};

struct RowTemplate {
    QByteArray open; // "<tr class=...>"
    std::vector<Cell> cells;
};

struct Borders {
    QByteArray top;
    QByteArray bottom;
    QByteArray left;
    QByteArray right;
    QByteArray fill;
};

class Writer {
public:
    Writer(Report& report, const ExportOptions& options, const QString& path)
        : m_walker(report)
        , m_path(path)
        , m_title(report.title().isEmpty() ? QFileInfo(report.fileName()).completeBaseName()
                                           : report.title())
        , m_separatePages(options.htmlSeparatePages())
        , m_navigator(options.htmlNavigator())
    {
        const PageGeometry g = PageGeometry::of(report.pageSetup());
        m_bodyWidth = std::max(1.0, g.width - g.left - g.right);
        setUpGrid(report);
    }

    int write()
    {
        const int pages = m_walker.run([this](const BandWalker::Instance& i) { visit(i); });
        if (m_files.empty())
            openFile(1);
        closeFile();
        for (const auto& file : m_files)
            file->commit();
        return pages;
    }

private:
    void setUpGrid(Report& report)
    {
        std::vector<int> edges { 0, static_cast<int>(m_bodyWidth) };
        for (const auto& s : report.sections()) {
            const auto* section = static_cast<const Section*>(s.get());
            if (section->isSuppressed())
                continue;
            for (const auto& o : section->objects()) {
                const ObjectDefinition& def = o->current();
                if (def.suppressed || def.kind == Kind::Subreport)
                    continue;
                edges.push_back(std::clamp(def.left, 0, static_cast<int>(m_bodyWidth)));
                edges.push_back(std::clamp(def.left + def.width, 0, static_cast<int>(m_bodyWidth)));
            }
        }
        std::sort(edges.begin(), edges.end());
        for (const int e : edges) {
            if (m_edges.empty() || e - m_edges.back() >= edgeTolerance)
                m_edges.push_back(e);
        }
        if (m_edges.size() < 2)
            m_edges.push_back(m_edges.back() + edgeTolerance);
        m_colgroup = "<colgroup>";
        for (size_t i = 0; i + 1 < m_edges.size(); ++i)
            m_colgroup += "<col style=\"width:" + pt(m_edges[i + 1] - m_edges[i]) + "\">";
        m_colgroup += "</colgroup>\n";
        m_tableWidth = pt(m_edges.back() - m_edges.front());
        // Every row's template (and so the whole style sheet) before the first file starts.
        for (const auto& s : report.sections()) {
            const auto* section = static_cast<const Section*>(s.get());
            if (!section->isSuppressed())
                rowTemplate(section);
        }
    }

    int edgeIndex(int x) const
    {
        size_t best = 0;
        for (size_t i = 1; i < m_edges.size(); ++i) {
            if (std::abs(m_edges[i] - x) < std::abs(m_edges[best] - x))
                best = i;
        }
        return static_cast<int>(best);
    }

    QByteArray objectClass(const ReportObject& object)
    {
        const auto found = m_objectClasses.find(&object);
        if (found != m_objectClasses.end())
            return found->second;
        const ObjectDefinition& def = object.current();
        const QByteArray name = "o" + QByteArray::number(m_objectClasses.size());
        QByteArray rule = "." + name + "{font-family:" + cssFamily(def.font.family)
            + ";font-size:" + QByteArray::number(def.font.pointSize, 'g', 4) + "pt";
        // Said either way: an object stacked under another in its cell inherits the rest.
        rule += def.font.bold ? ";font-weight:bold" : ";font-weight:normal";
        rule += def.font.italic ? ";font-style:italic" : ";font-style:normal";
        rule += def.font.underline ? ";text-decoration:underline" : ";text-decoration:none";
        rule += ";color:" + cssColor(def.color);
        static const char* const aligns[] = { "left", "center", "right", "justify" };
        rule += ";text-align:";
        rule += aligns[static_cast<int>(def.alignment)];
        if (!def.canGrow)
            rule += ";white-space:pre";
        rule += "}\n";
        m_css += rule;
        m_objectClasses.emplace(&object, name);
        return name;
    }

    const RowTemplate& rowTemplate(const Section* section)
    {
        const auto found = m_templates.find(section);
        if (found != m_templates.end())
            return found->second;
        const size_t columns = m_edges.size() - 1;
        std::vector<Borders> borders(columns);
        struct Placed {
            int first;
            int last; // exclusive
            std::vector<const ReportObject*> objects;
        };
        std::vector<const ReportObject*> content;
        for (const auto& o : section->objects()) {
            const ObjectDefinition& def = o->current();
            if (def.suppressed)
                continue;
            const int first = edgeIndex(def.left);
            const int last = std::max(first + 1, edgeIndex(def.left + def.width));
            if (def.kind == Kind::Line || def.kind == Kind::Box) {
                const QByteArray line
                    = pt(std::max(def.lineWidth, 10)) + " solid " + cssColor(def.color);
                if (def.kind == Kind::Line && def.height > def.width) {
                    borders[std::min(static_cast<size_t>(first), columns - 1)].left = line;
                    continue;
                }
                for (int c = first; c < last && c < static_cast<int>(columns); ++c) {
                    Borders& b = borders[static_cast<size_t>(c)];
                    if (def.kind == Kind::Line) {
                        (def.top * 2 < section->height() ? b.top : b.bottom) = line;
                        continue;
                    }
                    if (def.lineWidth > 0) {
                        b.top = b.bottom = line;
                        if (c == first)
                            b.left = line;
                        if (c == last - 1)
                            b.right = line;
                    }
                    if (!def.fillColor.isEmpty())
                        b.fill = cssColor(def.fillColor);
                }
                continue;
            }
            if (def.kind != Kind::Subreport)
                content.push_back(o.get());
        }
        std::stable_sort(
            content.begin(), content.end(), [](const ReportObject* a, const ReportObject* b) {
                return a->current().left < b->current().left;
            });
        std::vector<Placed> placed;
        for (const ReportObject* o : content) {
            const ObjectDefinition& def = o->current();
            const int first = std::min(edgeIndex(def.left), static_cast<int>(columns) - 1);
            const int last = std::max(first + 1, edgeIndex(def.left + def.width));
            if (!placed.empty() && first <= placed.back().first) {
                placed.back().objects.push_back(o);
                continue;
            }
            if (!placed.empty() && first < placed.back().last)
                placed.back().last = first;
            placed.push_back({ first, std::min(last, static_cast<int>(columns)), { o } });
        }
        RowTemplate row;
        const QByteArray sectionClass = "s" + QByteArray::number(m_templates.size());
        m_css += "." + sectionClass + "{height:" + pt(section->height()) + "}\n";
        row.open = "<tr class=\"" + sectionClass + "\">";
        auto openCell = [&](int first, int last, const QByteArray& cls) -> QByteArray {
            QByteArray tag = "<td";
            if (last - first > 1)
                tag += " colspan=\"" + QByteArray::number(last - first) + '"';
            if (!cls.isEmpty())
                tag += " class=\"" + cls + '"';
            const Borders& a = borders[static_cast<size_t>(first)];
            const Borders& z = borders[static_cast<size_t>(last - 1)];
            QByteArray style;
            if (!a.top.isEmpty())
                style += "border-top:" + a.top + ';';
            if (!a.bottom.isEmpty())
                style += "border-bottom:" + a.bottom + ';';
            if (!a.left.isEmpty())
                style += "border-left:" + a.left + ';';
            if (!z.right.isEmpty())
                style += "border-right:" + z.right + ';';
            if (!a.fill.isEmpty())
                style += "background:" + a.fill + ';';
            if (!style.isEmpty())
                tag += " style=\"" + style + '"';
            return tag + '>';
        };
        int column = 0;
        for (const Placed& p : placed) {
            for (; column < p.first; ++column)
                row.cells.push_back({ {}, openCell(column, column + 1, {}) });
            row.cells.push_back(
                { p.objects, openCell(p.first, p.last, objectClass(*p.objects.front())) });
            // The style sheet is written before the rows: every stacked object's rule now.
            for (const ReportObject* stacked : p.objects)
                objectClass(*stacked);
            column = p.last;
        }
        for (; column < static_cast<int>(columns); ++column)
            row.cells.push_back({ {}, openCell(column, column + 1, {}) });
        return m_templates.emplace(section, std::move(row)).first->second;
    }

    void appendObject(const ReportObject& object)
    {
        const ObjectDefinition& def = object.current();
        QByteArray uri;
        if (def.kind == Kind::Picture) {
            uri = object.formatState().pictureChanged ? dataUri(object.picture())
                                                      : dataUri(def.image);
        } else if (def.kind == Kind::Blob) {
            const Value value = m_walker.value(object);
            if (value.type() == ValueType::Binary)
                uri = dataUri(value.bytes());
        } else {
            appendEscaped(m_out, m_walker.text(object));
            return;
        }
        if (uri.isEmpty())
            return;
        m_out += "<img alt=\"\" style=\"width:" + pt(def.width) + ";height:" + pt(def.height)
            + ";object-fit:contain\" src=\"" + uri + "\">";
    }

    void writeRow(const Section* section)
    {
        const RowTemplate& row = rowTemplate(section);
        m_out += row.open;
        for (const Cell& cell : row.cells) {
            m_out += cell.open;
            for (size_t i = 0; i < cell.objects.size(); ++i) {
                if (i == 0) {
                    appendObject(*cell.objects[i]);
                    continue;
                }
                // Objects stacked in one column keep their own font, colour and alignment;
                // the cell's class is the first one's.
                m_out += "<div class=\"" + objectClass(*cell.objects[i]) + "\">";
                appendObject(*cell.objects[i]);
                m_out += "</div>";
            }
            m_out += "</td>";
        }
        m_out += "</tr>\n";
        if (m_out.size() > flushSize)
            flush();
    }

    void flush()
    {
        if (m_out.isEmpty())
            return;
        QFile& file = m_files.back()->file();
        if (file.write(m_out) != m_out.size())
            m_files.back()->fail(file.errorString());
        m_out.clear();
    }

    void navigator(int page)
    {
        const int last = m_walker.totalPages();
        if (!m_separatePages || !m_navigator || last <= 1)
            return;
        auto link = [&](int target, const char* label, const char* rel) {
            if (target == page || target < 1 || target > last) {
                m_out += "<span class=\"disabled\">";
                m_out += label;
                m_out += "</span> ";
                return;
            }
            const QString name = QFileInfo(HtmlExporter::pageFileName(m_path, target)).fileName();
            m_out += "<a href=\"" + escaped(QString::fromLatin1(QUrl::toPercentEncoding(name)))
                + "\" rel=\"" + rel + "\">" + label + "</a> ";
        };
        m_out += "<nav class=\"navigator\">";
        link(1, "First", "first");
        link(page - 1, "Previous", "prev");
        m_out += "<span class=\"position\">" + QByteArray::number(page) + " / "
            + QByteArray::number(last) + "</span> ";
        link(page + 1, "Next", "next");
        link(last, "Last", "last");
        m_out += "</nav>\n";
    }

    void openFile(int page)
    {
        const QString target = m_separatePages ? HtmlExporter::pageFileName(m_path, page) : m_path;
        m_files.push_back(std::make_unique<StagedFile>(target, QStringLiteral("HTML")));
        m_page = page;
        m_part = Part::None;
        m_out += "<!DOCTYPE html>\n<html>\n<head>\n<meta charset=\"utf-8\">\n"
                 "<meta name=\"generator\" content=\"LUD Mox\">\n<title>";
        appendEscaped(m_out, m_title);
        if (m_separatePages && m_walker.totalPages() > 1)
            m_out += " (" + QByteArray::number(page) + ")";
        m_out += "</title>\n" + styleSheet() + "</head>\n<body>\n";
        navigator(page);
        m_out
            += "<table class=\"page\" id=\"page" + QByteArray::number(page) + "\">\n" + m_colgroup;
    }

    void closeFile()
    {
        enter(Part::None);
        m_out += "</table>\n</body>\n</html>\n";
        flush();
        m_files.back()->finish();
    }

    QByteArray styleSheet() const
    {
        return "<style>\nbody{margin:0;padding:12pt;background:#fff;color:#000}\n"
               "table.page{border-collapse:collapse;table-layout:fixed;width:"
            + m_tableWidth
            + ";margin:0 0 24pt 0}\n"
              "table.page td{padding:0;vertical-align:top;overflow:hidden;"
              "overflow-wrap:anywhere;white-space:pre-wrap}\n"
              "nav.navigator{font-family:sans-serif;margin:0 0 12pt 0}\n"
              "nav.navigator .disabled{color:#888}\n"
            + m_css + "</style>\n";
    }

    enum class Part { None, Head, Body, Foot };
    void enter(Part part)
    {
        if (part == m_part)
            return;
        static const char* const closing[] = { "", "</thead>\n", "</tbody>\n", "</tfoot>\n" };
        static const char* const opening[] = { "", "<thead>\n", "<tbody>\n", "<tfoot>\n" };
        m_out += closing[static_cast<int>(m_part)];
        m_out += opening[static_cast<int>(part)];
        m_part = part;
    }

    void visit(const BandWalker::Instance& instance)
    {
        const bool continuous = !m_separatePages;
        if (m_files.empty())
            openFile(1);
        else if (!continuous && instance.page != m_page) {
            closeFile();
            openFile(instance.page);
        }
        switch (instance.band) {
        case Band::ReportHeader:
        case Band::PageHeader:
            if (continuous && instance.page > 1)
                return;
            enter(m_part == Part::None || m_part == Part::Head ? Part::Head : Part::Body);
            break;
        case Band::PageFooter:
            if (continuous && instance.page < m_walker.totalPages())
                return;
            enter(Part::Foot);
            break;
        default:
            enter(Part::Body);
        }
        writeRow(instance.section);
    }

    BandWalker m_walker;
    QString m_path;
    QString m_title;
    bool m_separatePages;
    bool m_navigator;
    double m_bodyWidth = 0;
    std::vector<int> m_edges;
    QByteArray m_colgroup;
    QByteArray m_tableWidth;
    QByteArray m_css;
    std::unordered_map<const ReportObject*, QByteArray> m_objectClasses;
    std::unordered_map<const Section*, RowTemplate> m_templates;
    std::vector<std::unique_ptr<StagedFile>> m_files;
    QByteArray m_out;
    int m_page = 0;
    Part m_part = Part::None;
};

} // namespace

QString HtmlExporter::pageFileName(const QString& path, int page)
{
    if (page <= 1)
        return path;
    const QFileInfo info(path);
    const QString name = info.fileName();
    const qsizetype dot = name.lastIndexOf(u'.');
    const QString numbered = dot > 0
        ? QString(name.left(dot) + QString::number(page) + name.mid(dot))
        : QString(name + QString::number(page));
    return info.dir().filePath(numbered);
}

int HtmlExporter::exportTo(Report& report, const ExportOptions& options, const QString& path)
{
    Writer writer(report, options, path);
    return writer.write();
}

} // namespace reportrt
