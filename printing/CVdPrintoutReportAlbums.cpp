// The photo albums at the end of a report: one album per photo type, up to four photos a page.
#include "printing/CVdPrintoutReport.h"

#include "document/CVdShared.h"
#include "document/VDRDocument.h"
#include "printing/CVdTexts.h"

#include <QBuffer>
#include <QFontMetrics>
#include <QImageReader>
#include <QPainter>
#include <QSqlError>
#include <QSqlQuery>

namespace {
QSqlDatabase albumDb()
{
    return QSqlDatabase::database(VDRDocument::connectionName(), false);
}

// Print texts per photo type 1..5: album title and the "Bild %1 von %2" caption.
const int kAlbumTitles[5] = {77, 78, 79, 80, 81};
const int kPhotoCaptions[5] = {34, 35, 36, 73, 74};

// A portrait taller than 3:4 is cut to 3:4 before it is fitted (as cropImage does).
QSize croppedSize(const QSize& size)
{
    if (size.width() > 0 && double(size.height()) / size.width() > 1.34)
        return QSize(size.width(), size.width() * 4 / 3);
    return size;
}

// Decodes a stored photo no larger than needed for 'box': a picture of twice the size or more is
// reduced while it is read, so a full-size camera picture never lives in memory. A smaller excess
// is left to the painter, which scales as it draws (in a PDF the page does, at no cost).
// Null when the bytes are not a picture.
QImage decodeFitted(const QByteArray& blob, const QSize& box)
{
    if (blob.isEmpty() || box.isEmpty())
        return QImage();
    QBuffer buffer;
    buffer.setData(blob);
    buffer.open(QIODevice::ReadOnly);
    QImageReader reader(&buffer);
    const QSize declared = reader.size();
    if (declared.isValid() && !declared.isEmpty()) {
        const QSize shown = croppedSize(declared);
        const QSize fitted = shown.scaled(box, Qt::KeepAspectRatio);
        if (2 * fitted.width() <= shown.width()) {
            const double f = double(fitted.width()) / shown.width();
            reader.setScaledSize(
                QSize(qMax(1, qRound(declared.width() * f)), qMax(1, qRound(declared.height() * f))));
        }
    }
    QImage image;
    if (!reader.read(&image) || image.isNull())
        return QImage();
    return CVdPrintout::cropImage(image);
}
} // namespace

int CVdPrintoutReport::album_page_photos(int code)
{
    switch (code) {
    case 1:
    case 10:
        return 1;
    case 2:
    case 3:
    case 11:
    case 12:
        return 2;
    case 4:
    case 5:
    case 13:
    case 14:
        return 3;
    case 15:
        return 4;
    default:
        return 0;
    }
}

QList<int> CVdPrintoutReport::album_layouts(const QList<bool>& portrait)
{
    QList<int> codes;
    int i = 0;
    while (i < portrait.size()) {
        int code = portrait.at(i) ? 10 : 1;
        ++i;
        // The second photo always joins the first.
        if (i < portrait.size()) {
            const bool p = portrait.at(i++);
            code = code == 1 ? (p ? 3 : 2) : (p ? 11 : 12);
        }
        // A third joins only where it fits the pattern: after 2 a landscape, after 3 a portrait,
        // after 11 any photo.
        if (i < portrait.size()) {
            const bool p = portrait.at(i);
            int joined = 0;
            if (code == 2 && !p)
                joined = 4;
            else if (code == 3 && p)
                joined = 5;
            else if (code == 11)
                joined = p ? 13 : 14;
            if (joined) {
                code = joined;
                ++i;
            }
        }
        // A fourth only after three portraits, and only a portrait.
        if (code == 13 && i < portrait.size() && portrait.at(i)) {
            code = 15;
            ++i;
        }
        codes << code;
    }
    return codes;
}

QVector<QRect> CVdPrintoutReport::album_slots(int code, const QRect& area, int gap)
{
    const int x = area.x(), y = area.y();
    const int halfW = qMax(1, (area.width() - gap) / 2), halfH = qMax(1, (area.height() - gap) / 2);
    const int thirdH = qMax(1, (area.height() - 2 * gap) / 3);
    const int rightX = x + area.width() - halfW, lowerY = y + area.height() - halfH;
    const QRect top(x, y, area.width(), halfH), bottom(x, lowerY, area.width(), halfH);
    const QRect topLeft(x, y, halfW, halfH), topRight(rightX, y, halfW, halfH);
    const QRect bottomLeft(x, lowerY, halfW, halfH), bottomRight(rightX, lowerY, halfW, halfH);
    switch (code) {
    case 1:
    case 10:
        return {area};
    case 2:
    case 3:
    case 12:
        return {top, bottom};
    case 4:
        return {QRect(x, y, area.width(), thirdH), QRect(x, y + thirdH + gap, area.width(), thirdH),
                QRect(x, y + area.height() - thirdH, area.width(), thirdH)};
    case 5:
        return {top, bottomLeft, bottomRight};
    case 11:
        return {QRect(x, y, halfW, area.height()), QRect(rightX, y, halfW, area.height())};
    case 13:
        return {topLeft, topRight, bottomLeft};
    case 14:
        return {topLeft, topRight, bottom};
    case 15:
        return {topLeft, topRight, bottomLeft, bottomRight};
    default:
        return {};
    }
}

void CVdPrintoutReport::get_photos_info(int entryId, QMap<int, QList<CPhoto>>& progress,
                                        QMap<int, QList<CPhoto>>& defects,
                                        QMap<int, QList<CPhoto>>& obstructions,
                                        QMap<int, QList<CPhoto>>& measures,
                                        QMap<int, QList<CPhoto>>& materials)
{
    QMap<int, QList<CPhoto>>* maps[5] = {&progress, &defects, &obstructions, &measures, &materials};
    for (int t = 0; t < 5; ++t) {
        maps[t]->clear();
        m_albumPhotoIds[t].clear();
    }
    QSqlQuery q(albumDb());
    q.setForwardOnly(true);
    // A photo whose picture row is missing still gets its page (a grey box), hence the outer join.
    q.prepare(QStringLiteral("SELECT p.id, p.type, i.image_width, i.image_height FROM entry_photo p "
                             "LEFT JOIN image i ON i.id = p.photo_image_id WHERE p.entry_id = ? "
                             "AND p.type BETWEEN 1 AND 5 ORDER BY p.type, p.pos, p.id"));
    q.addBindValue(entryId);
    q.exec();
    CVdShared::check_sql_error(q.lastError(), QStringLiteral("CVdPrintoutReport"),
                               QStringLiteral("get_photos_info"), __LINE__);
    while (q.next()) {
        CPhoto photo;
        photo.id = q.value(0).toInt();
        photo.type = q.value(1).toInt();
        photo.width = q.value(2).toInt();
        photo.height = q.value(3).toInt();
        (*maps[photo.type - 1])[photo.type] << photo;
        m_albumPhotoIds[photo.type - 1].insert(photo.id);
    }
}

bool CVdPrintoutReport::get_photo(int photoId, AlbumPhoto& photo) const
{
    QSqlQuery q(albumDb());
    q.setForwardOnly(true);
    q.prepare(QStringLiteral("SELECT p.pos, p.type, p.caption, p.date, p.comment, c.company, c.lastname, "
                             "c.type, i.image FROM entry_photo p LEFT JOIN company c ON c.id = p.company_id "
                             "LEFT JOIN image i ON i.id = p.photo_image_id WHERE p.id = ?"));
    q.addBindValue(photoId);
    q.exec();
    CVdShared::check_sql_error(q.lastError(), QStringLiteral("CVdPrintoutReport"),
                               QStringLiteral("get_photo"), __LINE__);
    if (!q.next())
        return false;
    photo.pos = q.value(0).toInt();
    photo.type = q.value(1).toInt();
    // Empty text columns hold a single blank.
    photo.caption = q.value(2).toString().trimmed();
    photo.date = q.value(3).toString().trimmed();
    photo.comment = q.value(4).toString().trimmed();
    photo.company =
        q.value(5).isNull()
            ? QString()
            : CVdShared::getCompanyFormat1(q.value(5).toString().trimmed(), q.value(6).toString().trimmed(),
                                           q.value(7).toString().trimmed(), QStringLiteral(" "))
                  .trimmed();
    photo.blob = q.value(8).toByteArray();
    return true;
}

void CVdPrintoutReport::drawAlbums(QPainter& painter)
{
    get_photos_info(m_entryId, m_albumPhotos[0], m_albumPhotos[1], m_albumPhotos[2], m_albumPhotos[3],
                    m_albumPhotos[4]);
    for (int t = 0; t < 5; ++t)
        if (!m_albumPhotoIds[t].isEmpty())
            drawAlbum(painter, m_albumPhotos[t], CVdTexts::self()->text(kAlbumTitles[t]));
}

void CVdPrintoutReport::drawAlbum(QPainter& painter, const QMap<int, QList<CPhoto>>& map,
                                  const QString& title)
{
    for (auto it = map.cbegin(); it != map.cend(); ++it) {
        const QList<CPhoto>& photos = it.value();
        QList<bool> portrait;
        for (const CPhoto& photo : photos)
            portrait << (photo.width < photo.height);
        // The page count follows from the grouping alone; only the drawing pass reads pictures.
        int first = 0;
        for (const int code : album_layouts(portrait)) {
            next_page(painter);
            if (first == 0)
                drawAlbumTitle(painter, title);
            const int count = album_page_photos(code);
            if (m_drawing) {
                if (code < 10)
                    draw_photo_page1(painter, code, photos, first, count);
                else
                    draw_photo_page10(painter, code, photos, first, count);
            }
            first += count;
        }
    }
}

void CVdPrintoutReport::drawAlbumTitle(QPainter& painter, const QString& title)
{
    const int line = QFontMetrics(m_captionFont, paintDevice()).height();
    if (m_drawing) {
        painter.setFont(m_captionFont);
        draw_text_sl(painter, QRect(leftMargin, m_y, printWidth, line), title);
    }
    m_y += line + m_rowStep;
}

void CVdPrintoutReport::draw_photo_page1(QPainter& painter, int code, const QList<CPhoto>& photos, int first,
                                         int count)
{
    draw_photo_page(painter, code, photos, first, count);
}

void CVdPrintoutReport::draw_photo_page10(QPainter& painter, int code, const QList<CPhoto>& photos, int first,
                                          int count)
{
    draw_photo_page(painter, code, photos, first, count);
}

void CVdPrintoutReport::draw_photo_page(QPainter& painter, int code, const QList<CPhoto>& photos, int first,
                                        int count)
{
    const QRect area(leftMargin, m_y, printWidth, qMax(1, contentBottom - m_y));
    const QVector<QRect> pageSlots = album_slots(code, area, m_columnGap);
    for (int i = 0; i < count && i < pageSlots.size() && first + i < photos.size(); ++i)
        draw_photo(painter, pageSlots.at(i), photos.at(first + i), first + i + 1, photos.size());
    m_y = contentBottom;
}

void CVdPrintoutReport::draw_photo(QPainter& painter, const QRect& slot, const CPhoto& photo, int number,
                                   int count)
{
    AlbumPhoto data;
    const bool found = get_photo(photo.id, data);
    QStringList lines{CVdTexts::self()->text(kPhotoCaptions[photo.type - 1]).arg(number).arg(count)};
    const QDate date = QDate::fromString(data.date.left(10), Qt::ISODate);
    if (date.isValid())
        lines << CVdTexts::self()->text(37).arg(getDate4Language(date));
    if (!data.caption.isEmpty())
        lines << CVdTexts::self()->text(90) + data.caption;
    if (!data.company.isEmpty())
        lines << CVdTexts::self()->text(89) + data.company;
    const QString caption = lines.join(QLatin1Char('\n'));

    const QFontMetrics fm(contentsFont, paintDevice());
    const int spacing = int(ImagePageVerticalSpacingFactor * fm.height());
    // Long captions wrap but never take more than a third of the slot from the photo.
    const int captionHeight =
        qMin(fm.boundingRect(QRect(0, 0, slot.width(), slot.height()), multiLineFlags, caption).height(),
             slot.height() / 3);
    const QRect box(slot.x(), slot.y(), slot.width(), qMax(1, slot.height() - captionHeight - spacing));

    QImage image = found ? decodeFitted(data.blob, box.size()) : QImage();
    data.blob.clear();
    QRect target = box;
    if (!image.isNull()) {
        const QSize size = image.size().scaled(box.size(), Qt::KeepAspectRatio).boundedTo(box.size());
        target = QRect(box.x() + (box.width() - size.width()) / 2, box.y(), size.width(), size.height());
        painter.save();
        painter.setRenderHint(QPainter::SmoothPixmapTransform);
        painter.drawImage(target, image);
        painter.restore();
    } else {
        // Not a picture: its place stays visible so the caption still belongs to something.
        painter.fillRect(box, Qt::lightGray);
    }
    image = QImage();
    painter.setFont(contentsFont);
    const QRect captionRect(target.x(), target.bottom() + 1 + spacing, slot.right() - target.x() + 1,
                            captionHeight);
    draw_text_ml(painter, captionRect, caption, multiLineFlags);
}
