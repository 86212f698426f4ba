#include "editing/form/VDRRegisterNames.h"

QString VDRRegisterNames::registerName(int index)
{
    switch (index) {
    case Bautenstand:
        return tr("Bautenstand");
    case Anwesende:
        return tr("Anwesende");
    case Stoerungen:
        return tr("Störungen");
    case Bauablauf:
        return tr("Bauablauf");
    case Vermerke:
        return tr("Vermerke");
    case Baustoffe:
        return tr("Baustoffe");
    case PlaeneUndDokumente:
        return tr("Pläne und Dokumente");
    case GeraeteUndMaschinen:
        return tr("Geräte und Maschinen");
    }
    return QString();
}
