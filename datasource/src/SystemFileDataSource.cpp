#include "SystemFileDataSource.h"

#include <algorithm>
#include <exception>
#include <optional>

#include "DictionaryReader.h"
#include "ReaderRepairs.h"
#include "SFExtensionEncoding.h"
#include "SaveDS.h"
#include "TranscodingDataSource.h"
#include "codepage.h"
#include "qoramb.h"

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

QORA_FileStream::Data::FileName NameRecord(const char* text) {
    QORA_FileStream::Data::FileName name;
    name.Set(text);
    return name;
}

}  // namespace

SystemFileDataSource::SystemFileDataSource() = default;

SystemFileDataSource::SystemFileDataSource(const char* fileName)
    : SystemFileDataSource(NameRecord(fileName)) {}

SystemFileDataSource::SystemFileDataSource(const QORA_FileStream::Data::FileName& name) {
    if (!fStream.Open(name, "rb")) RaiseError(kErrCannotOpen, name.InInterfaceEncoding());
    NamingFailures(name.InInterfaceEncoding(), [this] { Read(); });
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
        QORA_FILE_CHECK_TEXT(kErrCaseWrite, !fAppendFailed, "toWrite");
        if (fState == kReading) {
            fAppendFailed = true;
            StartAppending();
            fAppendFailed = false;
        }
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

namespace {

// The file read a second time with its text handled in its own encoding: the
// code page of cnv, or UTF-8 when cnv is null. The name stays in the
// interface encoding.
std::unique_ptr<SystemFileDataSource> ReadInOwnEncoding(std::unique_ptr<SystemFileDataSource> first,
                                                        const QORA_FileStream::Data::FileName& name,
                                                        ConverterPtr cnv) {
    first.reset();
    std::optional<mbTextEncodingScope> scope;
    if (cnv)
        scope.emplace(std::move(cnv));
    else
        scope.emplace();
    auto source = std::make_unique<SystemFileDataSource>(name);
    scope.reset();
    source->SetFileName(name.InInterfaceEncoding());
    return source;
}

}  // namespace

std::unique_ptr<QORA_DataSource> OpenForReading(const char* fileName, WarningSink* warnings) {
    const QORA_FileStream::Data::FileName name = NameRecord(fileName);
    auto source = std::make_unique<SystemFileDataSource>(name);
    const std::string encoding = FileEncodingName(source->Settings());
    const std::string interfaceEncoding = InterfaceEncodingName();
    if (IsSameEncoding(encoding.c_str(), interfaceEncoding.c_str())) return source;
    // A locale whose code page is UTF-8 makes a UTF-8 interface in either mode.
    if (IsSameEncoding(interfaceEncoding.c_str(), "UTF-8")) {
        // Without a converter there is nothing to read the text with; the
        // wrapper refuses the name.
        if (ConverterPtr cnv{OpenConverter(encoding.c_str())})
            source = ReadInOwnEncoding(std::move(source), name, std::move(cnv));
        auto wrapper = std::make_unique<UTF8DataSource>(std::move(source), encoding, warnings);
        // Names cut to their 64 bytes may now repeat one another.
        RepairNames(*wrapper);
        return wrapper;
    }
    if (IsSameEncoding(encoding.c_str(), "UTF-8")) {
        source = ReadInOwnEncoding(std::move(source), name, nullptr);
        auto wrapper =
            std::make_unique<CodePageDataSource>(std::move(source), interfaceEncoding, warnings);
        RepairNames(*wrapper);
        return wrapper;
    }
    if (warnings) warnings->Warning(kWarnCodePageShown, encoding);
    return source;
}
