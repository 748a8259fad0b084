// Reads the header and the dictionary records of a system file, in file
// order, into its data source.
#pragma once

class SystemFileDataSource;
class QORA_StrBaseIO;

// Leaves the stream just after the type 999 record. A malformed file raises
// SystemFileException 1204 or 1205 with the failed condition.
void ReadDictionary(SystemFileDataSource& source, QORA_StrBaseIO& stream);
