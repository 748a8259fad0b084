#include "SystemFileDataSource.h"

#include <exception>

#include "DictionaryReader.h"
#include "ReaderRepairs.h"

SystemFileDataSource::SystemFileDataSource() = default;

SystemFileDataSource::SystemFileDataSource(const char* fileName) {
    if (!fStream.Open(fileName, "rb")) RaiseError(kErrCannotOpen, fileName);
    try {
        Read();
    } catch (const SystemFileException& e) {
        std::throw_with_nested(ErrorText("Datasource error # " + std::to_string(e.Number()) +
                                         " involving " + fileName));
    }
}

SystemFileDataSource::~SystemFileDataSource() = default;

void SystemFileDataSource::Read() {
    SetFileName(fStream.Name());
    ReadDictionary(*this, fStream);
    RepairAfterReading(*this, fSettings.fLongNamesSeen);
    fState = kReading;
    fDataStart = fStream.Tell();
}

QORA_InputCaseIterator* SystemFileDataSource::NewIterator(void* buffer) {
    if (fState != kReading) {
        // A file written by this source is read back from its start; the
        // finishing of the writing joins with the writer.
        const char* name = fStream.Name();
        if (name == nullptr || !fStream.Open(name, "rb")) RaiseError(kErrCannotOpen, GetFileName());
        fState = kReading;
    }
    return new Iterator(*this, buffer);
}

bool SystemFileDataSource::GetReleaseInfo(int* major, int* minor, int* revision) const {
    *major = fSettings.fReleaseMajor;
    *minor = fSettings.fReleaseMinor;
    *revision = fSettings.fReleaseRevision;
    return fSettings.HasSeen(kIntegerInfoExtension);
}

std::unique_ptr<QORA_DataSource> OpenForReading(const char* fileName, WarningSink*) {
    auto source = std::make_unique<SystemFileDataSource>(fileName);
    // The transcoding wrappers join here: for now the source is returned as
    // read, in the file's own encoding, and no warning is given.
    return source;
}
