// The committed example file is the sample the fixture builder makes, byte
// for byte. Run with QORA_REGENERATE_EXAMPLE=1 to rewrite it after a change.
#include <cstdlib>
#include <fstream>
#include <iterator>

#include "sample_file.h"

namespace {

const char* const kExamplePath = QORA_EXAMPLES_DIR "/sample.qsf";

fixture::Bytes ReadFile(const char* path) {
    std::ifstream in(path, std::ios::binary);
    return fixture::Bytes(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
}

TEST(ExampleFile, CommittedCopyMatchesTheSample) {
    const fixture::Bytes sample = fixture::SampleFile();
    if (const char* flag = std::getenv("QORA_REGENERATE_EXAMPLE"); flag && *flag == '1') {
        std::ofstream out(kExamplePath, std::ios::binary | std::ios::trunc);
        out.write(reinterpret_cast<const char*>(sample.data()), std::streamsize(sample.size()));
        ASSERT_TRUE(out.good()) << kExamplePath;
    }
    EXPECT_EQ(ReadFile(kExamplePath), sample)
        << kExamplePath << " is stale: rerun with QORA_REGENERATE_EXAMPLE=1";
}

}  // namespace
