#include "VDRTestCase.h"

#include "VDRTestFixtures.h"

#include <QDir>
#include <QtTest>

#define VDR_VERIFY_SLOTS() QVERIFY2(ownsTheSlots(), "override the hooks of VDRTestCase, not its slots")

bool VDRTestCase::ownsTheSlots() const
{
    for (const char* slot : {"initTestCase()", "init()", "cleanup()", "cleanupTestCase()"}) {
        if (metaObject()->indexOfMethod(slot) >= staticMetaObject.methodCount())
            return false;
    }
    return true;
}

QString VDRTestCase::newDiary(const QString& name) const
{
    const QString path = m_dir.filePath(name);
    QDir().mkpath(QFileInfo(path).path());
    QFile::remove(path);
    return VDRTestFixtures::createDiary(path) ? path : QString();
}

void VDRTestCase::initTestCase()
{
    VDR_VERIFY_SLOTS();
    QVERIFY(m_dir.isValid());
    QCOMPARE(VDRTestFixtures::isolateRun(m_dir.path()), temporaryFolder());
    m_prompt.reset();
    initRun();
    VDR_VERIFY_PROMPT(m_prompt);
}

void VDRTestCase::init()
{
    VDR_VERIFY_SLOTS();
    m_prompt.reset();
    initTest();
}

void VDRTestCase::cleanup()
{
    VDR_VERIFY_SLOTS();
    cleanupTest();
    VDR_VERIFY_PROMPT(m_prompt);
}

void VDRTestCase::cleanupTestCase()
{
    m_prompt.reset();
    cleanupRun();
    VDR_VERIFY_PROMPT(m_prompt);
}
