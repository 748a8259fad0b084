// A case: one row of values in the layout of a data source, and the base of
// the iterators that fill cases one at a time.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>

class QORA_DataSource;
class QORA_InputCaseIterator;

// ValueCount() 8-byte units of a data source: a double per numeric variable,
// blank-padded bytes (no terminator) for a string, in dictionary order.
class QORA_Case {
  public:
    // Without a buffer the case allocates its own units (zeroed); a caller's
    // buffer is used as it is and never freed.
    explicit QORA_Case(QORA_DataSource& source, void* buffer = nullptr);
    QORA_Case(const QORA_Case&) = delete;
    QORA_Case& operator=(const QORA_Case&) = delete;
    virtual ~QORA_Case();

    QORA_DataSource& DataSource() const { return *fpSource; }
    void* Buffer() const { return fpBuffer; }
    bool OwnsBuffer() const { return fpOwned != nullptr; }

    // The first unit of the variable at index.
    void* ValuePointer(int index) const;
    // No type check: the caller knows the variable is numeric.
    void SetNumeric(int index, double value);
    // Keeps the longest whole-character prefix of at most min(width, length)
    // bytes and blanks the rest of the variable's units. Precondition: a
    // string variable. A null text sets a blank value.
    void SetString(int index, const char* text, size_t length);
    void SetString(int index, const char* text);
    // System-missing for numbers, blanks for strings; first..last inclusive.
    void Clear(int first, int last);
    void ClearAll();

    // Points the case at other memory of ValueCount() units, not owned; the
    // memory the case owns, if any, stays allocated.
    void SetBuffer(void* buffer) { fpBuffer = buffer; }

    // The iterator chain: the next iterator and the setting passed down it.
    QORA_InputCaseIterator* GetLink() const { return fpLink; }
    void SetLink(QORA_InputCaseIterator* link) { fpLink = link; }
    int32_t GetSetting() const { return fSetting; }
    void SetSetting(int32_t setting) { fSetting = setting; }

  private:
    QORA_DataSource* fpSource;
    QORA_InputCaseIterator* fpLink = nullptr;
    std::unique_ptr<double[]> fpOwned;
    void* fpBuffer;
    int32_t fSetting = 0;
};

// The base of every case iterator: owns one case in the data source's layout
// and fills it one case at a time.
class QORA_InputCaseIterator {
  public:
    // Every observer of the source is told of the new iterator once, at the
    // end of this constructor: before the derived part exists, so an observer
    // must not call the iterator's virtual operations.
    explicit QORA_InputCaseIterator(QORA_DataSource& source, void* buffer = nullptr);
    QORA_InputCaseIterator(const QORA_InputCaseIterator&) = delete;
    QORA_InputCaseIterator& operator=(const QORA_InputCaseIterator&) = delete;
    virtual ~QORA_InputCaseIterator() = default;

    // Keeps the value in the case and passes it on to the linked iterator.
    virtual void ForwardSetting(int32_t value);
    virtual bool CanSeek() const = 0;
    // Makes caseNumber (0-based) the next case to read.
    virtual bool SeekCase(int64_t caseNumber) = 0;
    // The next case to read.
    virtual int64_t TellCase() const = 0;
    // Fills the case with the next case; false at the end of the data.
    // Every iterator finds its case's memory through Case().Buffer() at each
    // read, so that ReadCaseInto can lend it other memory.
    virtual bool ReadCase() = 0;
    // Reads the next case straight into units (ValueCount() units) instead
    // of the case's own memory, which keeps its previous contents.
    bool ReadCaseInto(void* units);

    QORA_DataSource& DataSource() const { return fCase.DataSource(); }
    QORA_Case& Case() { return fCase; }
    const QORA_Case& Case() const { return fCase; }
    // Links another iterator to this one's case and hands it the current setting.
    void Link(QORA_InputCaseIterator* other);

    void* ValuePointer(int index) const { return fCase.ValuePointer(index); }
    void SetNumeric(int index, double value) { fCase.SetNumeric(index, value); }
    void SetString(int index, const char* text, size_t length) {
        fCase.SetString(index, text, length);
    }
    void SetString(int index, const char* text) { fCase.SetString(index, text); }
    void Clear(int first, int last) { fCase.Clear(first, last); }
    void ClearAll() { fCase.ClearAll(); }

  private:
    QORA_Case fCase;
};
