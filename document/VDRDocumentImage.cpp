// The image store: pictures of the diary as JPEG rows of the image table.
#include "document/VDRDocument.h"

// Placeholders until the image store lands; every operation reports that nothing was stored.
int VDRDocument::createImage(const QString&) { return -1; }
int VDRDocument::createImage(const QImage&) { return -1; }
int VDRDocument::createImage(const QPixmap&) { return -1; }
bool VDRDocument::exchangeImage(int, const QImage&, bool) { return false; }
bool VDRDocument::exchangeImage(int, const QPixmap&, bool) { return false; }
QByteArray VDRDocument::getImageData(int) { return {}; }
QByteArray VDRDocument::getImageThumbnailData(int) { return {}; }
QImage VDRDocument::getImage(int) { return {}; }
QImage VDRDocument::getImageThumbnail(int) { return {}; }
QPixmap VDRDocument::getImagePixmap(int) { return {}; }
QPixmap VDRDocument::getImageThumbnailPixmap(int) { return {}; }
bool VDRDocument::getImageMetadata(int, QMap<QString, QVariant>&) { return false; }
bool VDRDocument::exportImage(int, const QString&) { return false; }
QString VDRDocument::getImageTempPath(int) { return {}; }
QString VDRDocument::getImageThumbnailTempPath(int) { return {}; }
QString VDRDocument::getImageTempPath4Upload(int) { return {}; }
QString VDRDocument::getImageThumbnailTempPath4Upload(int) { return {}; }
QList<int> VDRDocument::getImageIds() { return {}; }
int VDRDocument::countImageAccess(int) { return 0; }
bool VDRDocument::deleteImage(int) { return false; }
