#include "SystemFileHeader.h"

#include <algorithm>
#include <cstring>

#include "byteorder.h"

namespace {

const char kMagic[] = "$FL2";

std::string TrimmedText(const unsigned char* bytes, size_t size) {
    while (size > 0 && bytes[size - 1] == ' ') --size;
    return std::string(reinterpret_cast<const char*>(bytes), size);
}

void PutText(unsigned char* field, size_t size, const std::string& text) {
    const size_t n = strnlen(text.c_str(), std::min(size, text.size()));
    std::memcpy(field, text.data(), n);
    std::memset(field + n, ' ', size - n);
}

template <class T>
T Get(const unsigned char* bytes, size_t offset, bool swapped) {
    T value;
    std::memcpy(&value, bytes + offset, sizeof value);
    if (swapped) SwapBytes(&value, sizeof value);
    return value;
}

template <class T>
void Put(unsigned char* bytes, size_t offset, T value) {
    std::memcpy(bytes + offset, &value, sizeof value);
}

}  // namespace

bool SystemFileHeader::HasMagic(const unsigned char* bytes) {
    return std::memcmp(bytes + kMagicOffset, kMagic, kMagicSize) == 0;
}

SystemFileHeader SystemFileHeader::Decode(const unsigned char* bytes) {
    SystemFileHeader h;
    // A writer puts a small layout code; anything else means its bytes were
    // written the other way round.
    const int32_t layout = Get<int32_t>(bytes, kLayoutOffset, false);
    h.fSwapped = layout < 1 || layout > 255;
    h.fLayoutCode = Get<int32_t>(bytes, kLayoutOffset, h.fSwapped);
    h.fCaseSize = Get<int32_t>(bytes, kCaseSizeOffset, h.fSwapped);
    h.fCompression = Get<int32_t>(bytes, kCompressionOffset, h.fSwapped);
    h.fWeightIndex = Get<int32_t>(bytes, kWeightOffset, h.fSwapped);
    h.fCaseCount = Get<int32_t>(bytes, kCaseCountOffset, h.fSwapped);
    h.fBias = Get<double>(bytes, kBiasOffset, h.fSwapped);
    h.fProduct = TrimmedText(bytes + kProductOffset, kProductSize);
    h.fDate.assign(reinterpret_cast<const char*>(bytes + kDateOffset), kDateSize);
    h.fTime.assign(reinterpret_cast<const char*>(bytes + kTimeOffset), kTimeSize);
    h.fLabel = TrimmedText(bytes + kLabelOffset, kLabelSize);
    return h;
}

void SystemFileHeader::Encode(unsigned char* bytes) const {
    std::memcpy(bytes + kMagicOffset, kMagic, kMagicSize);
    PutText(bytes + kProductOffset, kProductSize, fProduct);
    Put(bytes, kLayoutOffset, fLayoutCode);
    Put(bytes, kCaseSizeOffset, fCaseSize);
    Put(bytes, kCompressionOffset, fCompression);
    Put(bytes, kWeightOffset, fWeightIndex);
    Put(bytes, kCaseCountOffset, fCaseCount);
    Put(bytes, kBiasOffset, fBias);
    PutText(bytes + kDateOffset, kDateSize, fDate);
    PutText(bytes + kTimeOffset, kTimeSize, fTime);
    PutText(bytes + kLabelOffset, kLabelSize, fLabel);
    std::memset(bytes + kPaddingOffset, 0, kSize - kPaddingOffset);
}
