// Tests, before a file entry is made, that a path can be opened the way a
// mode needs. Nothing stays open and no existing file is changed.
#pragma once

enum ProbeMode { kProbeRead = 1, kProbeWrite = 2, kProbeAppend = 3 };

// 0 when the path can be opened in the mode, else QORA_STATUS_CANNOT_OPEN
// (also for a null path or an unknown mode). The path is in the interface
// encoding.
int AccessProbe(const char* fileName, int mode);
