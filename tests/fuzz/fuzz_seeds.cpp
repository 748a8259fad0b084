// Writes the seed corpus of the open-and-read fuzz target into a directory:
// the sample file, which has every kind of dictionary record, and a plain
// file, both in either byte order, raw and compressed, and files in several
// encodings, so the fuzzer starts from deep inside the reader instead of from
// the magic number.
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <string>
#include <utility>

#include "sample_file.h"
#include "sysfile_builder.h"

using namespace fixture;

namespace {

Bytes PlainFile(Endian endian, bool compressed) {
    SysFileBuilder b(endian);
    b.Compressed(compressed);
    b.Numeric("A");
    b.String("B", 8);
    for (int i = 0; i < 10; ++i) b.Case({double(i * 7 - 20), std::string(size_t(i % 9), 'b')});
    return b.Build();
}

// A file whose text is in the encoding named: a name and a text given in
// that encoding's bytes, as a label, value labels, a missing value and a value.
Bytes EncodedFile(const std::string& encoding, const std::string& name, const std::string& text) {
    SysFileBuilder b;
    const std::string value = text.substr(0, 8);
    b.String("S", 8).LongName(name).Label(text).MissingStrings({value});
    b.ValueLabels({{value, text}}, {b.Slot("S")});
    b.LongNames().Encoding(encoding).Case({value});
    return b.Build();
}

// Each seed twice: its first byte chooses the interface encoding of the
// fuzz target, code page (0) or UTF-8 (1).
bool Write(const std::string& path, const Bytes& bytes) {
    bool ok = true;
    for (uint8_t mode : {0, 1}) {
        std::ofstream out(path + "." + std::to_string(mode), std::ios::binary | std::ios::trunc);
        out.put(char(mode));
        out.write(reinterpret_cast<const char*>(bytes.data()), std::streamsize(bytes.size()));
        ok = out.good() && ok;
    }
    return ok;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: fuzz_seeds DIRECTORY\n");
        return 2;
    }
    const std::string dir = argv[1];
    bool ok = true;
    for (Endian endian : {Endian::Native, Endian::Swapped}) {
        for (bool compressed : {false, true}) {
            const std::string suffix =
                std::string(endian == Endian::Native ? "native" : "swapped") +
                (compressed ? "-compressed" : "-raw") + ".qsf";
            ok = Write(dir + "/sample-" + suffix, SampleFile(endian, compressed)) && ok;
            ok = Write(dir + "/plain-" + suffix, PlainFile(endian, compressed)) && ok;
        }
    }
    const std::pair<const char*, Bytes> encoded[] = {
        {"latin1", EncodedFile("ISO-8859-1", "Gr\xF6\xDF", "Ma\xDF in \xE9t\xE9s")},
        {"cp1252", EncodedFile("windows-1252", "Preis\x80", "5 \x80 \x84quoted\x93")},
        {"gbk", EncodedFile("GBK", "\xD0\xD5\xC3\xFB", "\xD6\xD0\xCE\xC4 \xB1\xEA")},
        {"sjis", EncodedFile("windows-31j", "\x96\xBC\x91\x4F", "\x93\xFA\x96\x7B\x8C\xEA")},
        {"utf8",
         EncodedFile("UTF-8", "Gr\xC3\xB6\xC3\x9F", "\xE4\xB8\xAD\xE6\x96\x87 \xE2\x82\xAC")},
    };
    for (const auto& [name, bytes] : encoded)
        ok = Write(dir + "/encoded-" + name + ".qsf", bytes) && ok;
    return ok ? 0 : 1;
}
