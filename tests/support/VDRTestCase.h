#pragma once

#include "VDRTestPrompt.h"

#include <QObject>
#include <QTemporaryDir>

// The base of every test class. Settings and temporary files of the run go to a folder of its own
// (m_dir: settings in "settings", TMPDIR in "tmp"); the test prompt is reset before each test function
// and checked after it, so that a message nobody expected fails the function.
//
// QtTest calls initTestCase(), init(), cleanup() and cleanupTestCase() by name, and a slot of the test
// class would hide the base's. A test class therefore never declares them: it overrides the hooks.
class VDRTestCase : public QObject
{
    Q_OBJECT

protected:
    // Once, after the run is isolated; a message shown here must be expected here.
    virtual void initRun() {}
    // Once at the end; checked for messages as a test function is.
    virtual void cleanupRun() {}
    // Before each test function (each data row), after the prompt is reset.
    virtual void initTest() {}
    // After each test function, before the prompt is checked.
    virtual void cleanupTest() {}

    QString settingsFolder() const { return m_dir.filePath(QStringLiteral("settings")); }
    QString temporaryFolder() const { return m_dir.filePath(QStringLiteral("tmp")); }
    // A new diary 'name' (a path in m_dir) as the application saves one, replacing an older file of
    // that name; empty when it cannot be made.
    QString newDiary(const QString& name) const;

    QTemporaryDir m_dir;
    VDRTestPrompt m_prompt;

private slots:
    void initTestCase();
    void init();
    void cleanup();
    void cleanupTestCase();

private:
    // True when no test class hides one of the slots above.
    bool ownsTheSlots() const;
};
