#include "app/VDRApplication.h"

#include <QFileOpenEvent>

VDRApplication::VDRApplication(int& argc, char** argv) : QApplication(argc, argv) {}

bool VDRApplication::event(QEvent* event)
{
    if (event->type() == QEvent::FileOpen) {
        m_fileToOpen = static_cast<QFileOpenEvent*>(event)->file();
        emit fileOpenRequested(m_fileToOpen);
        return true;
    }
    return QApplication::event(event);
}
