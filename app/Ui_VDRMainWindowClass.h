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

    // Gives each entry an '&' before a letter no sibling uses, so the texts stay as they are.
    // Run again after a text changed.
    static void assignMnemonics(const QList<QAction*>& actions);
    // The text as the user reads it, without the mnemonic marks.
    static QString plainText(QString text);

    QToolBar* mainToolBar = nullptr;
    QMenu* menuFileRecent = nullptr;
    QMenu* menuSyncFiles = nullptr;

private:
    QMenu* buildMenu(QMainWindow* window, QMenu* parent, const QString& name);
    QAction* makeAction(QMainWindow* window, const QString& name, const QString& label);

    QHash<QString, QAction*> m_actions;
    QHash<QString, QMenu*> m_menus;
};
