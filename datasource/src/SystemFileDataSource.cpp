#include "SystemFileDataSource.h"

#include <algorithm>
#include <exception>

#include "DictionaryReader.h"
#include "ReaderRepairs.h"
#include "SFExtensionEncoding.h"
#include "SaveDS.h"

namespace {

// Runs body; a SystemFileException comes out as an internal error with the
// same number and the file name, nesting the original.
template <class Body>
void NamingFailures(const std::string& fileName, Body body) {
    try {
        body();
    } catch (const SystemFileException& e) {
        std::throw_with_nested(ErrorText("Datasource error # " + std::to_string(e.Number()) +
                                         " involving " + fileName));
    }
}

}  // namespace

SystemFileDataSource::SystemFileDataSource() = default;

SystemFileDataSource::SystemFileDataSource(const char* fileName) {
    if (!fStream.Open(fileName, "rb")) RaiseError(kErrCannotOpen, fileName);
    NamingFailures(fileName, [this] { Read(); });
}

SystemFileDataSource::~SystemFileDataSource() {
    try {
        FinishWriting();
    } catch (...) {
        // Nothing may escape a destructor; the writer has finished the file
        // as far as it could.
    }
}

void SystemFileDataSource::Read() {
    SetFileName(fStream.Name());
    ReadDictionary(*this, fStream);
    RepairAfterReading(*this, fSettings.fLongNamesSeen);
    fState = kReading;
    fDataStart = fStream.Tell();
}

QORA_InputCaseIterator* SystemFileDataSource::NewIterator(void* buffer) {
    FinishWriting();
    if (fState != kReading) {
        // A file written by this source is read back from its start.
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

// The names are checked and the records prepared before the file is
// created, so a dictionary that cannot be written leaves an existing file
// alone.
void SystemFileDataSource::CommitDictionary() {
    if (fState != kNothingYet) RaiseError(kErrWriteWhileReading);
    SetCharacterCodeFromEncoding(fSettings);
    NamingFailures(GetFileName(), [this] {
        auto writer = std::make_unique<SaveDS>(*this, fStream, fSettings);
        writer->PrepareDictionary();
        if (!fStream.Open(GetFileName().c_str(), "wb")) RaiseError(kErrCannotOpen, GetFileName());
        writer->WriteDictionary();
        fSettings.fCaseSize = writer->ValueCount();
        fDataStart = fStream.Tell();
        writer->StartCases(fIndex, fDataStart);
        // Later lookups of the short names search the list.
        std::sort(fSettings.fNameList.begin(), fSettings.fNameList.end(),
                  [](const auto& a, const auto& b) { return a.first < b.first; });
        fpWriter = std::move(writer);
        fState = kWriting;
    });
}

void SystemFileDataSource::WriteCase(const void* units) {
    if (fLiveIterators > 0) RaiseError(kErrWriteWhileReading);
    if (fState == kNothingYet) CommitDictionary();
    NamingFailures(GetFileName(), [&] {
        if (fState == kReading) StartAppending();
        fState = kWriting;
        fpWriter->WriteCase(units);
    });
}

void SystemFileDataSource::StartAppending() {
    auto writer = std::make_unique<SaveDS>(*this, fStream, fSettings);
    writer->PrepareAppend(fIndex, fDataStart, fCaseCountRecordPos);
    fpWriter = std::move(writer);
}

void SystemFileDataSource::FinishWriting() {
    if (fState != kWriting) return;
    fState = kReading;
    const bool whole = fpWriter->Finish();
    fpWriter.reset();
    fStream.Commit();
    if (!whole) RaiseError(kErrStreamWrite, GetFileName());
}

std::unique_ptr<QORA_DataSource> OpenForReading(const char* fileName, WarningSink*) {
    auto source = std::make_unique<SystemFileDataSource>(fileName);
    // The transcoding wrappers join here: for now the source is returned as
    // read, in the file's own encoding, and no warning is given.
    return source;
}
