#pragma once

#include <QApplication>

// The application object: remembers a file the desktop asked it to open.
class VDRApplication : public QApplication
{
    Q_OBJECT
public:
    VDRApplication(int& argc, char** argv);

    QString fileToOpen() const { return m_fileToOpen; }
    void clearFileToOpen() { m_fileToOpen.clear(); }

    bool event(QEvent* event) override;

signals:
    void fileOpenRequested(const QString& path);

private:
    QString m_fileToOpen;
};
