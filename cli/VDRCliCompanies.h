#pragma once

#include <QString>

class QTextStream;

// 'varduna-cli companies': the two company lists of a diary in their order, each company in both
// output formats. Returns the exit code (0 done, 2 refused).
int cliListCompanies(const QString& file, bool json, QTextStream& out);
