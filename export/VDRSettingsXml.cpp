#include "VDRSettingsXml.h"

#include <QCoreApplication>
#include <QFile>
#include <QStringList>
#include <QXmlStreamReader>
#include <QXmlStreamWriter>

namespace {

const QString RootElement = QStringLiteral("Settings");
const QString NumberPrefix = QStringLiteral("value_");

// Bounds for a file from outside. The lists need six levels below the root
// (language/title/column/values/index/centry) and a few megabytes at most.
constexpr int MaxDepth = 16;
constexpr qint64 MaxFileMegabytes = 8;
constexpr qint64 MaxFileSize = MaxFileMegabytes * 1024 * 1024;
// Keys repeat the names of their parents, so nesting could make the result far larger than the
// file; a real file's keys and values take about as many characters as the file itself.
constexpr qint64 OutputPerInputCharacter = 4;
constexpr qint64 OutputAllowance = 64 * 1024;

QString tooLargeText()
{
    return QCoreApplication::translate("VDRSettingsXml", "Die Datei ist größer als %1 MB")
        .arg(MaxFileMegabytes);
}

// Segments the mobile app knows under fixed names: a comma and "º" cannot stand in an element name.
const QList<QPair<QString, QString>>& specialSegments()
{
    static const QList<QPair<QString, QString>> list{
        {QStringLiteral("Equipo, máquina"), QStringLiteral("Equipo_máquina")},
        {QStringLiteral("Nº índice"), QStringLiteral("No_índice")},
    };
    return list;
}

bool isDigits(const QString& text)
{
    if (text.isEmpty())
        return false;
    for (const QChar c : text)
        if (c < QLatin1Char('0') || c > QLatin1Char('9'))
            return false;
    return true;
}

// XML 1.0 name characters; ":" is left out because the reader would take it for a namespace prefix.
bool isNameStartChar(ushort c)
{
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || c == '_' || (c >= 0xC0 && c <= 0xD6) ||
           (c >= 0xD8 && c <= 0xF6) || (c >= 0xF8 && c <= 0x2FF) || (c >= 0x370 && c <= 0x37D) ||
           (c >= 0x37F && c <= 0x1FFF) || c == 0x200C || c == 0x200D || (c >= 0x2070 && c <= 0x218F) ||
           (c >= 0x2C00 && c <= 0x2FEF) || (c >= 0x3001 && c <= 0xD7FF) || (c >= 0xF900 && c <= 0xFDCF) ||
           (c >= 0xFDF0 && c <= 0xFFFD);
}

bool isNameChar(ushort c)
{
    return isNameStartChar(c) || c == '-' || c == '.' || (c >= '0' && c <= '9') || c == 0xB7 ||
           (c >= 0x300 && c <= 0x36F) || c == 0x203F || c == 0x2040;
}

QString escaped(QChar c)
{
    return QStringLiteral("_x") +
           QString::number(c.unicode(), 16).toUpper().rightJustified(4, QLatin1Char('0')) + QLatin1Char('_');
}

// "_xHHHH_" at 'pos'; returns -1 when there is none.
int escapedCodeAt(const QString& name, int pos)
{
    if (pos + 7 > name.size() || name.at(pos + 1) != QLatin1Char('x') || name.at(pos + 6) != QLatin1Char('_'))
        return -1;
    int code = 0;
    for (int i = pos + 2; i < pos + 6; ++i) {
        const int digit = QStringLiteral("0123456789ABCDEF").indexOf(name.at(i).toUpper());
        if (digit < 0)
            return -1;
        code = code * 16 + digit;
    }
    return code;
}

// 'escapeBlanks' writes blanks as "_x0020_" too: then no plain "_" is left that could be misread.
QString encodeSegment(const QString& segment, bool escapeBlanks)
{
    QString name;
    for (int i = 0; i < segment.size(); ++i) {
        const QChar c = segment.at(i);
        if (c == QLatin1Char(' ') && !escapeBlanks)
            name += QLatin1Char('_');
        else if (c != QLatin1Char('_') && (i == 0 ? isNameStartChar(c.unicode()) : isNameChar(c.unicode())))
            name += c;
        else
            name += escaped(c);
    }
    return name;
}

// Text in XML 1.0 may not hold most control characters; a carriage return would come back as a line feed.
void writeValue(QXmlStreamWriter& xml, const QString& text)
{
    QString part;
    for (const QChar c : text) {
        const ushort u = c.unicode();
        if (u == '\r') {
            xml.writeCharacters(part);
            part.clear();
            xml.writeEntityReference(QStringLiteral("#13"));
        } else if ((u >= 0x20 && u != 0xFFFE && u != 0xFFFF) || u == '\n' || u == '\t') {
            part += c;
        }
    }
    xml.writeCharacters(part);
}

QString valueText(const QVariant& value)
{
    if (value.type() == QVariant::StringList)
        return value.toStringList().join(QLatin1Char('\n'));
    return value.toString();
}

} // namespace

QString xmlElementName(const QString& segment)
{
    for (const auto& special : specialSegments())
        if (segment == special.first)
            return special.second;
    if (isDigits(segment))
        return NumberPrefix + segment;
    const QString name = encodeSegment(segment, false);
    // "value 3", "Equipo máquina" or " x0041 " would read back as something else.
    return settingsKeySegment(name) == segment ? name : encodeSegment(segment, true);
}

QString settingsKeySegment(const QString& elementName)
{
    for (const auto& special : specialSegments())
        if (elementName == special.second)
            return special.first;
    if (elementName.startsWith(NumberPrefix) && isDigits(elementName.mid(NumberPrefix.size())))
        return elementName.mid(NumberPrefix.size());
    QString segment;
    for (int i = 0; i < elementName.size(); ++i) {
        const QChar c = elementName.at(i);
        if (c != QLatin1Char('_')) {
            segment += c;
            continue;
        }
        const int code = escapedCodeAt(elementName, i);
        if (code >= 0) {
            segment += QChar(ushort(code));
            i += 6;
        } else {
            segment += QLatin1Char(' ');
        }
    }
    return segment;
}

bool writeXmlFile(QIODevice& device, const QSettings::SettingsMap& map)
{
    QXmlStreamWriter xml(&device);
    xml.setAutoFormatting(true);
    xml.writeStartDocument();
    xml.writeStartElement(RootElement);
    QStringList open;
    for (auto it = map.constBegin(); it != map.constEnd(); ++it) {
        const QStringList segments = it.key().split(QLatin1Char('/'), Qt::SkipEmptyParts);
        if (segments.isEmpty())
            continue;
        int shared = 0;
        while (shared < open.size() && shared < segments.size() && open.at(shared) == segments.at(shared))
            ++shared;
        while (open.size() > shared) {
            xml.writeEndElement();
            open.removeLast();
        }
        for (int i = shared; i < segments.size(); ++i) {
            xml.writeStartElement(xmlElementName(segments.at(i)));
            open << segments.at(i);
        }
        writeValue(xml, valueText(it.value()));
    }
    while (!open.isEmpty()) {
        xml.writeEndElement();
        open.removeLast();
    }
    xml.writeEndElement();
    xml.writeEndDocument();
    return !xml.hasError();
}

bool readXmlSettings(QIODevice& device, QSettings::SettingsMap& map, QString* errorText)
{
    map.clear();
    if (!device.isSequential() && device.size() - device.pos() > MaxFileSize) {
        if (errorText)
            *errorText = tooLargeText();
        return false;
    }
    QXmlStreamReader xml(&device);
    qint64 output = 0;
    struct Open
    {
        QString segment;
        QString text;
        bool hasChildren = false;
    };
    QList<Open> open;
    bool rootSeen = false;
    while (!xml.atEnd()) {
        switch (xml.readNext()) {
        case QXmlStreamReader::StartElement:
            if (!rootSeen) {
                rootSeen = true;
                if (xml.name() != RootElement)
                    xml.raiseError(
                        QCoreApplication::translate("VDRSettingsXml", "Wurzelelement \"%1\" erwartet")
                            .arg(RootElement));
                break;
            }
            if (open.size() >= MaxDepth) {
                xml.raiseError(QCoreApplication::translate(
                                   "VDRSettingsXml", "Die Elemente sind tiefer als %1 Ebenen verschachtelt")
                                   .arg(MaxDepth));
                break;
            }
            if (!open.isEmpty())
                open.last().hasChildren = true;
            open.append({settingsKeySegment(xml.name().toString()), QString(), false});
            break;
        case QXmlStreamReader::Characters:
        case QXmlStreamReader::EntityReference:
            if (!open.isEmpty())
                open.last().text += xml.text();
            break;
        case QXmlStreamReader::EndElement:
            if (!open.isEmpty()) {
                const Open element = open.takeLast();
                // Between child elements there is only the writer's indentation.
                if (!element.hasChildren || !element.text.trimmed().isEmpty()) {
                    QStringList path;
                    for (const Open& parent : qAsConst(open))
                        path << parent.segment;
                    path << element.segment;
                    const QString key = path.join(QLatin1Char('/'));
                    output += key.size() + element.text.size();
                    if (output > OutputPerInputCharacter * xml.characterOffset() + OutputAllowance) {
                        xml.raiseError(QCoreApplication::translate(
                            "VDRSettingsXml", "Die Schlüssel und Texte der Datei sind zu umfangreich"));
                        break;
                    }
                    map.insert(key, element.text);
                }
            }
            break;
        default:
            break;
        }
        // Devices of unknown size are bounded while they are read.
        if (!xml.hasError() && xml.characterOffset() > MaxFileSize)
            xml.raiseError(tooLargeText());
    }
    if (!xml.hasError())
        return true;
    map.clear();
    if (errorText)
        *errorText = xml.errorString() + QStringLiteral(" at line ") + QString::number(xml.lineNumber());
    return false;
}

bool readXmlFile(QIODevice& device, QSettings::SettingsMap& map)
{
    return readXmlSettings(device, map, nullptr);
}

bool readXmlSettingsFile(const QString& path, QSettings::SettingsMap& map, QString* errorText)
{
    map.clear();
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly)) {
        if (errorText)
            *errorText = file.errorString();
        return false;
    }
    // QSettings treats an empty file as an empty store; so do we.
    if (file.size() == 0)
        return true;
    return readXmlSettings(file, map, errorText);
}

QSettings::Format xmlSettingsFormat()
{
    static const QSettings::Format format =
        QSettings::registerFormat(QStringLiteral("xml"), readXmlFile, writeXmlFile);
    return format;
}
