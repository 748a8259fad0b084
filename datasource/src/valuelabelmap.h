// Value label maps: labels attached to single values of a variable. One map
// may serve several variables (all those of one value label record); handles
// separate them on the first change.
#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "refcnt.h"

class QORA_VLMapImpl : public QORA_RefCntObject {
  public:
    enum { eMaxKeyType = 32767 };
    // A key: units(key type) 8-byte value units; a numeric key is one double,
    // a string key the blank-padded bytes of the value. A key is held without
    // its trailing all-blank units beyond the first, so that short values of
    // a wide string cost what they hold.
    struct Pair {
        std::string key;
        std::string label;
    };

    explicit QORA_VLMapImpl(int32_t keyType);
    ~QORA_VLMapImpl() override = default;

    // Whether a key type (a variable type, perhaps from a file) can be served.
    static bool IsValidKeyType(int32_t keyType) { return 0 <= keyType && keyType <= eMaxKeyType; }
    // Value units of a key of the given type: 1 up to 8 bytes, else (w + 7) / 8.
    static int UnitsFor(int32_t keyType) { return keyType <= 8 ? 1 : (keyType + 7) / 8; }
    // The ordering of keys: unit by unit, each unit as a little-endian double.
    // Returns <0, 0 or >0; 0 only for keys equal bit for bit once padded
    // with blank units to the same length.
    static int CompareKeys(const std::string& a, const std::string& b);

    int32_t KeyType() const { return fKeyType; }
    void SetKeyType(int32_t keyType);
    int KeyBytes() const { return 8 * UnitsFor(fKeyType); }
    const std::vector<Pair>& Pairs() const { return *fPairs; }

    // Adds the pair, or replaces the label of an equal key.
    void Insert(std::string key, std::string label);
    // Adds every pair, as Insert would one after the other, in O(n log n).
    void InsertAll(std::vector<Pair> pairs);
    // The label of a key bit-for-bit equal to key, or null.
    const std::string* Lookup(const std::string& key) const;

  private:
    std::vector<Pair>::const_iterator LowerBound(const std::string& key) const;
    std::vector<Pair>& EditPairs();

    int32_t fKeyType;
    // Sorted by CompareKeys, no two keys equal. Clones made to change only
    // the key type share the pairs until one of them changes a pair.
    std::shared_ptr<std::vector<Pair>> fPairs;
};

// The handle to a value label map (null for no labels), with an optional
// iteration cursor of its own. Copies share the map and get a cursor at the
// same position; the cursor is never shared.
class QORA_VLMap {
  public:
    QORA_VLMap() = default;
    // A new empty map of the key type (asserts IsValidKeyType).
    explicit QORA_VLMap(int32_t keyType);

    bool IsValid() const { return fpImpl.IsValid(); }
    const QORA_VLMapImpl* Impl() const { return fpImpl.Get(); }
    bool SameObject(const QORA_VLMap& other) const { return fpImpl.SameObject(other.fpImpl); }

    int32_t KeyType() const;  // 0 for a null handle
    void SetKeyType(int32_t keyType);
    int Count() const;  // 0 for a null handle

    // Inserting replaces the label of an existing equal key. Preconditions:
    // a valid handle; units points at KeyBytes() bytes.
    void Insert(const void* units, const std::string& label);
    void Insert(double value, const std::string& label);
    // text of length bytes (-1: up to its terminator), padded with blanks to
    // the key's units; a longer text is cut at a whole character.
    void Insert(const char* text, int length, const std::string& label);
    // Each pair's key is whole units, at most KeyBytes(), padded with blank
    // units as needed; the same as Insert one by one.
    void InsertAll(std::vector<QORA_VLMapImpl::Pair> pairs);
    // The key of a text as Insert(text, length, label) makes it, as held.
    std::string KeyFromText(const char* text, int length) const;

    // The label of the key, or null when absent or the handle is null.
    const std::string* Lookup(const void* units) const;
    const std::string* Lookup(double value) const;
    const std::string* Lookup(const char* text, int length) const;

    // Walking the pairs in key order: Reset, then Next until it returns 0.
    void Reset();
    bool End() const;
    // The key's units (KeyBytes() bytes) and its label; 1, or 0 at the end.
    int Next(std::string& units, std::string& label);
    // The first unit of the key as a double.
    int NextNumber(double& value, std::string& label);
    // The key as text of exactly KeyType() bytes.
    int NextText(std::string& text, std::string& label);

    // Same object or both null, or the same pairs in the same order (the key
    // type is not compared).
    bool operator==(const QORA_VLMap& other) const;
    bool operator!=(const QORA_VLMap& other) const { return !(*this == other); }

  private:
    const QORA_VLMapImpl::Pair* Step();

    QORA_CowRef<QORA_VLMapImpl> fpImpl;
    // The cursor: a position in the pairs of whatever map the handle holds.
    std::optional<size_t> fIter;
};
