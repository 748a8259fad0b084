#include "valuelabelmap.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "qoramb.h"

namespace {

const char kBlankUnit[] = "        ";

// Up to this many pairs are sorted by insertion.
enum : size_t { kFewPairs = 16 };

// One 8-byte unit as stored: a little-endian double, whatever the host; a
// unit past the end of the key is blank.
double UnitValue(const std::string& key, size_t unit) {
    const char* bytes = 8 * unit < key.size() ? &key[8 * unit] : kBlankUnit;
    uint64_t bits = 0;
    for (int i = 7; i >= 0; --i) bits = (bits << 8) | static_cast<unsigned char>(bytes[i]);
    double value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

int64_t UnitBits(double value) {
    int64_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

std::string UnitBytes(double value) {
    uint64_t bits;
    std::memcpy(&bits, &value, sizeof bits);
    std::string key(8, '\0');
    for (int i = 0; i < 8; ++i) key[i] = static_cast<char>(bits >> (8 * i));
    return key;
}

// Numeric order, made total so that a binary search can rely on it: values
// that compare equal as numbers (0 and -0) are told apart by their bits,
// negative zero first, and NaNs (string chunks can look like one) come after
// every number.
int CompareUnits(double a, double b) {
    bool nanA = std::isnan(a), nanB = std::isnan(b);
    if (!nanA && !nanB) {
        if (a < b) return -1;
        if (b < a) return 1;
    } else if (nanA != nanB) {
        return nanA ? 1 : -1;
    }
    int64_t bitsA = UnitBits(a), bitsB = UnitBits(b);
    return bitsA < bitsB ? -1 : bitsA > bitsB ? 1 : 0;
}

// The key as held: without trailing blank units beyond the first, in a
// string of its own size.
std::string Trimmed(std::string key) {
    size_t size = key.size();
    while (size > 8 && key.compare(size - 8, 8, kBlankUnit) == 0) size -= 8;
    return size == key.size() ? key : key.substr(0, size);
}

}  // namespace

QORA_VLMapImpl::QORA_VLMapImpl(int32_t keyType)
    : fKeyType(keyType), fPairs(std::make_shared<std::vector<Pair>>()) {
    QORA_ASSERT(IsValidKeyType(keyType));
}

// Keys of different lengths (a held key, or one stored before a change of
// key type) are compared as if padded with blank units.
int QORA_VLMapImpl::CompareKeys(const std::string& a, const std::string& b) {
    const size_t units = (std::max(a.size(), b.size()) + 7) / 8;
    for (size_t u = 0; u < units; ++u) {
        int c = CompareUnits(UnitValue(a, u), UnitValue(b, u));
        if (c != 0) return c;
    }
    return 0;
}

void QORA_VLMapImpl::SetKeyType(int32_t keyType) {
    QORA_ASSERT(IsValidKeyType(keyType));
    fKeyType = keyType;
}

std::vector<QORA_VLMapImpl::Pair>::const_iterator QORA_VLMapImpl::LowerBound(
    const std::string& key) const {
    return std::lower_bound(fPairs->begin(), fPairs->end(), key,
                            [](const Pair& pair, const std::string& probe) {
                                return CompareKeys(pair.key, probe) < 0;
                            });
}

std::vector<QORA_VLMapImpl::Pair>& QORA_VLMapImpl::EditPairs() {
    if (fPairs.use_count() > 1) fPairs = std::make_shared<std::vector<Pair>>(*fPairs);
    return *fPairs;
}

void QORA_VLMapImpl::Insert(std::string key, std::string label) {
    key = Trimmed(std::move(key));
    const size_t at = LowerBound(key) - fPairs->begin();
    std::vector<Pair>& pairs = EditPairs();
    if (at < pairs.size() && pairs[at].key == key) {
        pairs[at].label = std::move(label);
    } else {
        pairs.insert(pairs.begin() + at, Pair{std::move(key), std::move(label)});
    }
}

// A stable sort keeps equal keys in their order of arrival; the last of them
// wins, as it would by replacing the label of the ones before. The few
// labels of most records are sorted by insertion, which needs no buffer as
// the library's stable sort does, and merged in place: a large dictionary
// holds many small maps.
void QORA_VLMapImpl::InsertAll(std::vector<Pair> pairs) {
    pairs.insert(pairs.begin(), fPairs->begin(), fPairs->end());
    for (Pair& pair : pairs) pair.key = Trimmed(std::move(pair.key));
    const auto less = [](const Pair& a, const Pair& b) { return CompareKeys(a.key, b.key) < 0; };
    if (pairs.size() > kFewPairs) {
        std::stable_sort(pairs.begin(), pairs.end(), less);
    } else {
        for (size_t i = 1; i < pairs.size(); ++i)
            for (size_t j = i; j > 0 && less(pairs[j], pairs[j - 1]); --j)
                std::swap(pairs[j], pairs[j - 1]);
    }
    size_t kept = 0;
    for (size_t i = 0; i < pairs.size(); ++i) {
        if (kept > 0 && pairs[kept - 1].key == pairs[i].key) {
            pairs[kept - 1].label = std::move(pairs[i].label);
        } else {
            if (kept != i) pairs[kept] = std::move(pairs[i]);
            ++kept;
        }
    }
    pairs.erase(pairs.begin() + std::ptrdiff_t(kept), pairs.end());
    pairs.shrink_to_fit();
    if (fPairs.use_count() > 1)
        fPairs = std::make_shared<std::vector<Pair>>(std::move(pairs));
    else
        *fPairs = std::move(pairs);
}

const std::string* QORA_VLMapImpl::Lookup(const std::string& key) const {
    const std::string held = Trimmed(key);
    auto it = LowerBound(held);
    return it != fPairs->end() && it->key == held ? &it->label : nullptr;
}

QORA_VLMap::QORA_VLMap(int32_t keyType) : fpImpl(new QORA_VLMapImpl(keyType)) {}

int32_t QORA_VLMap::KeyType() const { return fpImpl.IsValid() ? fpImpl->KeyType() : 0; }

void QORA_VLMap::SetKeyType(int32_t keyType) {
    if (Count() > 0) {
        fpImpl.Mutable()->SetKeyType(keyType);
    } else {
        fpImpl.Reset(new QORA_VLMapImpl(keyType));
    }
}

int QORA_VLMap::Count() const {
    return fpImpl.IsValid() ? static_cast<int>(fpImpl->Pairs().size()) : 0;
}

void QORA_VLMap::Insert(const void* units, const std::string& label) {
    QORA_ASSERT(IsValid());
    QORA_ASSERT(units != nullptr);
    fpImpl.Mutable()->Insert(std::string(static_cast<const char*>(units), fpImpl->KeyBytes()),
                             label);
}

void QORA_VLMap::Insert(double value, const std::string& label) {
    QORA_ASSERT(IsValid());
    fpImpl.Mutable()->Insert(UnitBytes(value), label);
}

void QORA_VLMap::Insert(const char* text, int length, const std::string& label) {
    QORA_ASSERT(IsValid());
    fpImpl.Mutable()->Insert(KeyFromText(text, length), label);
}

const std::string* QORA_VLMap::Lookup(const void* units) const {
    if (!IsValid() || units == nullptr) return nullptr;
    return fpImpl->Lookup(std::string(static_cast<const char*>(units), fpImpl->KeyBytes()));
}

const std::string* QORA_VLMap::Lookup(double value) const {
    return IsValid() ? fpImpl->Lookup(UnitBytes(value)) : nullptr;
}

const std::string* QORA_VLMap::Lookup(const char* text, int length) const {
    return IsValid() ? fpImpl->Lookup(KeyFromText(text, length)) : nullptr;
}

void QORA_VLMap::InsertAll(std::vector<QORA_VLMapImpl::Pair> pairs) {
    QORA_ASSERT(IsValid());
    for (const auto& pair : pairs) {
        QORA_ASSERT(!pair.key.empty() && pair.key.size() % 8 == 0);
        QORA_ASSERT(pair.key.size() <= size_t(fpImpl->KeyBytes()));
    }
    fpImpl.Mutable()->InsertAll(std::move(pairs));
}

std::string QORA_VLMap::KeyFromText(const char* text, int length) const {
    std::string key(fpImpl->KeyBytes(), ' ');
    if (text == nullptr) return Trimmed(std::move(key));
    if (length < 0) length = static_cast<int>(std::strlen(text));
    mbCopyPadded(key.data(), key.size(), text, length);
    return Trimmed(std::move(key));
}

void QORA_VLMap::Reset() { fIter = 0; }

bool QORA_VLMap::End() const {
    QORA_ASSERT(fIter && "Reset() missing");
    return !IsValid() || *fIter >= fpImpl->Pairs().size();
}

// The pair under the cursor, and the cursor moved past it; null at the end.
const QORA_VLMapImpl::Pair* QORA_VLMap::Step() {
    if (!IsValid()) return nullptr;
    if (End()) return nullptr;
    return &fpImpl->Pairs()[(*fIter)++];
}

int QORA_VLMap::Next(std::string& units, std::string& label) {
    const QORA_VLMapImpl::Pair* pair = Step();
    if (!pair) return 0;
    units = pair->key;
    if (units.size() < size_t(fpImpl->KeyBytes())) units.resize(fpImpl->KeyBytes(), ' ');
    label = pair->label;
    return 1;
}

int QORA_VLMap::NextNumber(double& value, std::string& label) {
    const QORA_VLMapImpl::Pair* pair = Step();
    if (!pair) return 0;
    value = pair->key.size() >= 8 ? UnitValue(pair->key, 0) : 0.0;
    label = pair->label;
    return 1;
}

// A key stored before the key type grew is padded with blanks to the new width.
int QORA_VLMap::NextText(std::string& text, std::string& label) {
    const QORA_VLMapImpl::Pair* pair = Step();
    if (!pair) return 0;
    text = pair->key;
    text.resize(fpImpl->KeyType(), ' ');
    label = pair->label;
    return 1;
}

bool QORA_VLMap::operator==(const QORA_VLMap& other) const {
    if (SameObject(other)) return true;
    if (!IsValid() || !other.IsValid()) return false;
    const auto& a = fpImpl->Pairs();
    const auto& b = other.fpImpl->Pairs();
    return a.size() == b.size() &&
           std::equal(a.begin(), a.end(), b.begin(), [](const auto& x, const auto& y) {
               return x.key == y.key && x.label == y.label;
           });
}
