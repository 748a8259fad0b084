// What the reader puts right once a file's dictionary is read: names no
// caller could use, set members the file does not have, and the case of
// names in files without long names.
#pragma once

class QORA_DataSource;

// Everything below, in order: sets pruned, names repaired, and without long
// names every name lower-cased (the sets written again to match).
void RepairAfterReading(QORA_DataSource& source, bool longNamesSeen);

// Gives every variable whose name is not a valid name, or repeats an earlier
// one, a new name v1, v2, ... that no other variable has.
void RepairNames(QORA_DataSource& source);
