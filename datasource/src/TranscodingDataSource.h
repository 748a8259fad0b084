// A read-only view of a system file whose text is in another encoding than
// the interface's: the dictionary is converted once, when the view is made,
// and the string values of each case as the case is read.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "SystemFileDataSource.h"
#include "case.h"
#include "codepage.h"
#include "valuelabelmap.h"

class TranscodingDataSource : public QORA_DataSource {
  public:
    class Iterator;

    ~TranscodingDataSource() override;

    QORA_InputCaseIterator* NewIterator(void* buffer) override;
    int64_t CaseCount() const override { return fpFile->CaseCount(); }

  protected:
    // How one direction converts: the conversion and its length, the width a
    // string of width w gets, and the warning number of a lossy dictionary.
    struct Direction {
        int (*convert)(UConverter*, char*, int, const char*, int, int*);
        int (*length)(UConverter*, const char*, int, int*);
        int (*width)(int);
        long lossWarning;
    };

    // Takes the file over and converts its dictionary to or from the code
    // page named by encoding, which a converter must be able to open.
    TranscodingDataSource(std::unique_ptr<SystemFileDataSource> file, const std::string& encoding,
                          const Direction& direction, WarningSink* warnings);

  private:
    // How a run of the converted case is made from the file's case: a
    // string (sourceWidth > 0) is converted, numbers are copied.
    struct PlanEntry {
        uint32_t sourceUnit;
        int32_t sourceWidth;  // 0 for a run of numbers
        int32_t targetUnits;
        int32_t targetWidth;
    };
    struct Data {
        std::vector<PlanEntry> _plan;
        std::string _encoding;
        ConverterPtr _converter;  // while the dictionary is converted
        bool _lossy = false;
    };

    // A map shared by several variables is converted once and stays shared.
    using ConvertedMaps = std::map<const QORA_VLMapImpl*, QORA_VLMap>;

    void ConvertDictionary();
    void ConvertVariable(int index, ConvertedMaps& maps);
    void AddToPlan(const PlanEntry& entry);
    QORA_VLMap Convert(const QORA_VLMap& labels);
    void ConvertSets();
    // The text converted; at most maxBytes (when not negative), cut at a
    // whole character.
    std::string Convert(const std::string& text, int maxBytes = -1);
    Attributes Convert(const Attributes& attributes);

    const Direction fDirection;
    std::unique_ptr<SystemFileDataSource> fpFile;
    std::unique_ptr<Data> _my;
};

// Reads the file's cases through an iterator of its own and converts them.
class TranscodingDataSource::Iterator : public QORA_InputCaseIterator {
  public:
    Iterator(TranscodingDataSource& source, void* buffer);

    bool CanSeek() const override { return fpFile->CanSeek(); }
    bool SeekCase(int64_t caseNumber) override { return fpFile->SeekCase(caseNumber); }
    int64_t TellCase() const override { return fpFile->TellCase(); }
    bool ReadCase() override;

  private:
    const TranscodingDataSource& fSource;
    std::unique_ptr<QORA_InputCaseIterator> fpFile;
    ConverterPtr fCnv;
};

// The interface is UTF-8 and the file is in a code page: strings become three
// times as wide (at most 32767 bytes).
class UTF8DataSource : public TranscodingDataSource {
  public:
    UTF8DataSource(std::unique_ptr<SystemFileDataSource> file, const std::string& fileEncoding,
                   WarningSink* warnings);
};

// The interface is a code page and the file is in UTF-8: string widths stay.
class CodePageDataSource : public TranscodingDataSource {
  public:
    CodePageDataSource(std::unique_ptr<SystemFileDataSource> file,
                       const std::string& interfaceEncoding, WarningSink* warnings);
};
