#pragma once

#include <QCoreApplication>
#include <QHash>
#include <QString>

class QAction;
class QMainWindow;
class QMenu;
class QToolBar;

// The main window's menus, actions and tool bar, with the object names other code looks up.
class Ui_VDRMainWindowClass
{
    Q_DECLARE_TR_FUNCTIONS(VDRMainWindow)
public:
    void setupUi(QMainWindow* window);

    QAction* action(const QString& objectName) const { return m_actions.value(objectName); }
    QMenu* menu(const QString& objectName) const { return m_menus.value(objectName); }
    QList<QAction*> allActions() const { return m_actions.values(); }

    QToolBar* mainToolBar = nullptr;
    QMenu* menuFileRecent = nullptr;
    QMenu* menuSyncFiles = nullptr;

private:
    QMenu* buildMenu(QMainWindow* window, QMenu* parent, const QString& name);
    QAction* makeAction(QMainWindow* window, const QString& name, const QString& label);

    QHash<QString, QAction*> m_actions;
    QHash<QString, QMenu*> m_menus;
};
