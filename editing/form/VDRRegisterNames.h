#pragma once

#include <QCoreApplication>
#include <QString>

// The registers (tabs) of the report form that suggestion lists belong to. Kept here until the
// report form exists; its registerName(index) can then forward to this.
class VDRRegisterNames
{
    Q_DECLARE_TR_FUNCTIONS(VDRRegisterNames)

public:
    // A fixed type: lists read from settings or exchange files may carry any number.
    enum RegisterNames : int
    {
        Bautenstand = 0,
        Anwesende = 1,
        Stoerungen = 2,
        Bauablauf = 3,
        Vermerke = 4,
        Baustoffe = 5,
        PlaeneUndDokumente = 6,
        GeraeteUndMaschinen = 7,
    };

    // The tab title; an index outside the list gives an empty name.
    static QString registerName(int index);
};
