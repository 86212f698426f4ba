#include "printing/PDFReaderTimer.h"

#include "printing/VDRPrintHooks.h"

#include <QTimer>

PDFReaderTimer::PDFReaderTimer(const QString& path, QObject* parent) : QObject(parent), m_path(path) {}

void PDFReaderTimer::start(int msec)
{
    QTimer::singleShot(msec, this, &PDFReaderTimer::sl_openPDF);
}

void PDFReaderTimer::sl_openPDF()
{
    // The window's hook hands the file to the desktop as a file URL; no shell sees the name.
    VDRPrintHooks::openFile(m_path);
    deleteLater();
}
