#pragma once

#include <QString>

// One header text block and where it goes, in device pixels.
class CVdTextInfo
{
public:
    QString text;
    int width = 0;
    int height = 0;
    int x = 0;
};
