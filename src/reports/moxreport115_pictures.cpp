// Picture fields: while the runtime formats a section that holds one of the report's three
// picture objects, put the host's picture, a picture file named by the data, or the size of
// a stored image into it. Nothing here reaches the host: a picture that cannot be had
// leaves the object as the report designed it.

#include "core/comerror.h"
#include "core/variant.h"
#include "platform/twips.h"
#include "reports/moxreport115.h"
#include "reports/moxreport115_p.h"
#include "reports/reportslogging_p.h"
#include "runtime/reportobject.h"
#include "runtime/section.h"

#include <QByteArray>
#include <QFileInfo>
#include <QImageReader>

using namespace Qt::StringLiterals;

namespace reports {

namespace {

const QString picturePrefix = u"LUDPICTURE_"_s;
const QString fileStoreData = u"LUDFile.Filedata"_s;
const QString fileStoreWidth = u"LUDFile.Width"_s;
const QString fileStoreHeight = u"LUDFile.Height"_s;

/// A whole number as Basic assigns a Double to a Long: half to the even neighbour.
int32_t whole(double value)
{
    return core::Variant(value).toLong();
}

/// The picture in the file at `path`; null unless it is a readable regular file holding an
/// image. A path that comes from the report's data is used for nothing else.
QImage loadPicture(const QString& path)
{
    const QFileInfo file(path);
    if (!file.isFile() || !file.isReadable())
        return {};
    QImageReader reader(path);
    reader.setAutoTransform(true);
    return reader.read();
}

} // namespace

QString MoxReport115::OlePath() const
{
    return d->OlePath;
}

void MoxReport115::OlePath(const QString& value)
{
    d->OlePath = value;
}

core::VariantArray MoxReport115::PictureBytes() const
{
    return d->PictureBytes;
}

void MoxReport115::PictureBytes(const core::VariantArray& value)
{
    // Image file contents are a list of bytes; a table of them is no picture.
    if (value.dimensions() != 1)
        throw core::ComError::basic(core::ErrorNumber::TypeMismatch);
    // A copy of the host's array, so later changes on either side stay there.
    const int32_t lower = value.lbound();
    core::VariantArray bytes({ value.bounds().front() }, core::VariantType::Byte);
    for (int32_t i = lower; i <= value.ubound(); ++i)
        bytes.at(i) = core::Variant(value.at(i).toByte());
    d->PictureBytes = std::move(bytes);
}

QImage MoxReport115::PictureFromBytes(const core::VariantArray& bytes)
{
    if (bytes.size() == 0)
        return {};
    QByteArray data;
    data.reserve(static_cast<qsizetype>(bytes.size()));
    try {
        for (const core::Variant& value : bytes.values())
            data.append(static_cast<char>(value.toByte()));
    } catch (const core::ComError&) {
        return {};
    }
    return QImage::fromData(data);
}

void MoxReport115::mSection_format()
{
    traceReport(u"mSection_format"_s);
    const auto object = d->OleObject;
    if (!object)
        return;
    if (!d->OlePath.isEmpty()) {
        const QImage picture = loadPicture(d->OlePath);
        if (!picture.isNull())
            ignoringErrors([&] { object->setPicture(picture); });
        return;
    }
    if (d->PictureBytes.ubound() > 0) {
        const QImage picture = PictureFromBytes(d->PictureBytes);
        if (!picture.isNull())
            ignoringErrors([&] { object->setPicture(picture); });
    }
}

void MoxReport115::mPictureSection_format()
{
    traceReport(u"mPictureSection_format"_s);
    const auto object = d->PictureObject;
    const auto section = d->mPictureSection.section;
    if (!object || !section)
        return;
    QString name;
    ignoringErrors([&] { name = object->name(); });
    if (!name.contains(picturePrefix, Qt::CaseInsensitive))
        return;
    const QString wanted = name.mid(picturePrefix.size());

    std::vector<std::shared_ptr<runtime::ReportObject>> objects;
    ignoringErrors([&] { objects = section->reportObjects(); });
    for (const auto& candidate : objects) {
        QString candidateName;
        ignoringErrors([&] { candidateName = candidate->name(); });
        if (candidateName.compare(wanted, Qt::CaseInsensitive) != 0)
            continue;
        QString path;
        ignoringErrors([&] { path = candidate->value().toText(); });
        if (path.isEmpty())
            return;
        const QImage picture = loadPicture(path);
        if (picture.isNull())
            return;
        try {
            object->setPicture(picture);
        } catch (const core::ComError&) {
            return;
        }
        ignoringErrors([&] {
            const QImage shown = object->picture();
            // A picture without width has no proportions to keep.
            if (shown.width() <= 0)
                return;
            const int32_t width = object->width();
            object->setHeight(whole(static_cast<double>(int64_t(shown.height()) * width)
                / static_cast<double>(shown.width())));
        });
        return;
    }
}

void MoxReport115::mBlobPictureSection_format()
{
    traceReport(u"mPictureSection_format"_s);
    const auto object = d->BlobObject;
    const auto section = d->mBlobPictureSection.section;
    if (!object || !section)
        return;
    QString bound;
    ignoringErrors([&] { bound = object->fieldName(); });
    if (!bound.contains(fileStoreData, Qt::CaseInsensitive))
        return;

    int32_t pixelsWide = 0;
    int32_t pixelsHigh = 0;
    std::vector<std::shared_ptr<runtime::ReportObject>> objects;
    ignoringErrors([&] { objects = section->reportObjects(); });
    for (const auto& candidate : objects) {
        ignoringErrors([&] {
            if (candidate->typeName() != u"IFieldObject")
                return;
            const QString field = candidate->fieldName();
            if (field.contains(fileStoreWidth, Qt::CaseInsensitive))
                pixelsWide = candidate->value().toLong();
            if (field.contains(fileStoreHeight, Qt::CaseInsensitive))
                pixelsHigh = candidate->value().toLong();
        });
        if (pixelsWide != 0 && pixelsHigh != 0)
            break;
    }
    if (pixelsWide == 0 || pixelsHigh == 0)
        return;

    int32_t pw = 0;
    int32_t ph = 0;
    int32_t bw = 0;
    int32_t bh = 0;
    try {
        pw = whole(pixelsWide * platform::twipsPerPixelX());
        ph = whole(pixelsHigh * platform::twipsPerPixelY());
        bw = object->width();
        bh = object->height();
    } catch (const core::ComError&) {
        return;
    }
    if (pw <= 0 || ph <= 0)
        return;

    // Fit into the designed box without enlarging, keeping the proportions.
    int32_t nw = pw;
    int32_t nh = ph;
    if (ph > bh) {
        nh = bh;
        nw = whole(static_cast<double>(nh) / ph * pw);
        if (nw > bw) {
            nw = bw;
            nh = whole(static_cast<double>(nw) / pw * ph);
        }
    } else if (pw > bw) {
        nw = bw;
        nh = whole(static_cast<double>(nw) / pw * ph);
    }

    // Centre it in the box.
    const int32_t dx = whole(bw / 2.0 - nw / 2.0);
    const int32_t dy = whole(bh / 2.0 - nh / 2.0);
    ignoringErrors([&] { object->setLeft(object->left() + dx); });
    ignoringErrors([&] { object->setTop(object->top() + dy); });
    ignoringErrors([&] { object->setHeight(nh); });
    ignoringErrors([&] { object->setWidth(nw); });
}

} // namespace reports
