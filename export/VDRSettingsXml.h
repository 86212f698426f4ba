#pragma once

#include <QSettings>
#include <QString>

class QIODevice;

// The settings format "xml" of the suggestion-text exchange file shared with the mobile app:
// root element "Settings", every key split at "/" into nested elements, the value as the leaf's text.
// A numeric segment is written as "value_" + digits, a blank as "_"; "Equipo, máquina" and
// "Nº índice" become "Equipo_máquina" and "No_índice". Characters that cannot stand in an element
// name, and "_" itself, are written as "_xHHHH_" so that every key reads back exactly.

bool writeXmlFile(QIODevice& device, const QSettings::SettingsMap& map);
bool readXmlFile(QIODevice& device, QSettings::SettingsMap& map);

// Parses 'device' like readXmlFile; on failure 'errorText' holds the reader's message followed by
// " at line " and the line number, and 'map' is left empty. Files come from outside: one larger than
// 8 MB, nested deeper than 16 elements below the root, or whose keys and values would take more than
// four times its own characters is refused.
bool readXmlSettings(QIODevice& device, QSettings::SettingsMap& map, QString* errorText);
// The same for a file; an empty file is an empty map. A file that cannot be opened is an error too.
bool readXmlSettingsFile(const QString& path, QSettings::SettingsMap& map, QString* errorText);

// The format registered once under the name "xml".
QSettings::Format xmlSettingsFormat();

// Element name for one key segment and back.
QString xmlElementName(const QString& segment);
QString settingsKeySegment(const QString& elementName);
