#pragma once

#include <QString>

class QTextStream;
class VDRDocument;

// 'varduna-cli companies': the two company lists of an open diary in their order, each company in
// both output formats. Returns the exit code (0 done).
int cliListCompanies(VDRDocument& doc, bool json, QTextStream& out);
