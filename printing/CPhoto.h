#pragma once

#include <QString>

// One photo of a report as the photo pages need it.
class CPhoto
{
public:
    int id = 0;
    int type = 0;
    int width = 0;
    int height = 0;
    QString text;
};
