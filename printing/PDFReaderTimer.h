#pragma once

#include <QObject>
#include <QString>

// Hands a finished PDF to the system's viewer a moment after it was written, then goes away.
class PDFReaderTimer : public QObject
{
    Q_OBJECT
public:
    PDFReaderTimer(const QString& path, QObject* parent);

    QString path() const { return m_path; }
    // Opens the file after 'msec' milliseconds.
    void start(int msec = 100);

public slots:
    void sl_openPDF();

private:
    QString m_path;
};
