// SPDX-License-Identifier: MIT
// The names of the ports, which are the same under UDP and TCP.
#include <string>
#include <tuple>
#include <unordered_map>
#include <vector>

#include <gtest/gtest.h>

#include "support/runs.h"

namespace netfloor::test {
namespace {

constexpr std::size_t ipv4Fields = 18;

struct PortNames {
    std::string md, to; // of the source port; the destination port has to agree
};

std::string between(const std::string &text, const std::string &front, const std::string &back) {
    EXPECT_TRUE(text.starts_with(front) && text.ends_with(back) && text.size() >= front.size() + back.size()) << text;
    return text.substr(front.size(), text.size() - front.size() - back.size());
}

PortNames portNames(std::uint16_t port) {
    const Octets packet = ipv4({.protocol = 17, .payload = udp(port, port)});
    const Report md = sharedHost().run(Pass::md, packet);
    const Report to = sharedHost().run(Pass::to, packet);
    const std::string number = " (" + std::to_string(port) + ")";
    const std::string name = between(md.fields[ipv4Fields].text, "  UDP Source Port=", number);
    const std::string mnemonic = between(to.displays[ipv4Fields].text, "UDP - ", number);
    EXPECT_EQ(md.fields[ipv4Fields + 1].text, "  UDP Destination Port=" + name + number);
    EXPECT_EQ(to.displays[ipv4Fields + 1].text, "UDP - " + mnemonic + number);
    return {name, mnemonic};
}

// For each named port, FNV-1a over "port|long text|mnemonic", from a list that was not made from the plug-in's.
const std::unordered_map<unsigned, std::uint32_t> digests = {
    {1, 0x46c4ffb5},    {2, 0x2c979db7},    {3, 0x65cc41e9},    {5, 0x0fea2432},    {7, 0xae68a838},
    {9, 0x9a41fd4c},    {11, 0x58453ae7},   {13, 0x0aec2885},   {17, 0xb1bd6335},   {18, 0xe6b0f491},
    {19, 0x49e97b33},   {20, 0x0f4cfbd0},   {21, 0xa40d5e3a},   {23, 0xa5a64b0a},   {25, 0x58022794},
    {27, 0xc6e89197},   {29, 0xfa384f4d},   {31, 0xf04105f2},   {33, 0x5abf628d},   {37, 0xc22be7b5},
    {38, 0xc70b984e},   {39, 0x01383370},   {41, 0xd49da4b8},   {42, 0x7cbc233b},   {43, 0x1942eb55},
    {44, 0x4f9d0994},   {45, 0xd87cc6a0},   {46, 0x1102b664},   {47, 0xc61e6177},   {48, 0xa30e3d8f},
    {49, 0x623c45ac},   {50, 0x4becede7},   {51, 0xe277607a},   {52, 0x9e2bb5dd},   {53, 0xa4b08fbb},
    {54, 0xeb98eb97},   {55, 0x276422d2},   {56, 0x5ae0f065},   {58, 0x3fefeb3f},   {61, 0x93dbabbf},
    {62, 0xf25bc52e},   {64, 0x7a11dc16},   {65, 0x28f18feb},   {66, 0xcfc5c9e1},   {67, 0x644b5be8},
    {68, 0x14c75c0f},   {69, 0xcda0742e},   {70, 0x72c73c2c},   {71, 0xdb6796c9},   {72, 0xeacffd4d},
    {73, 0xb51cdb1d},   {74, 0xb3ef1d71},   {76, 0x6a1c93b3},   {78, 0xc28efef2},   {79, 0xdf39f0f3},
    {80, 0x00142471},   {81, 0x5d292a32},   {82, 0xe8bb66dd},   {83, 0xe7eff4d3},   {84, 0x944be5ef},
    {85, 0xdbb79c35},   {86, 0x0655ba16},   {88, 0x13f9a21f},   {89, 0x34bce4ec},   {90, 0x021658dc},
    {91, 0x420d8f01},   {92, 0xc5dd20cd},   {93, 0x2b83cb03},   {94, 0x52ad3fea},   {95, 0xb2598685},
    {96, 0xd2f4f46d},   {97, 0x11fc48ab},   {98, 0xef7721a4},   {99, 0x7bc261a0},   {101, 0x43f4978c},
    {102, 0x4913fba2},  {103, 0x1dab644d},  {104, 0xcf84c76b},  {105, 0xf7efcb1d},  {106, 0xe0a6b94e},
    {107, 0x23480916},  {108, 0x091018d8},  {109, 0x4a32636d},  {110, 0x66eb33dd},  {111, 0x401c539a},
    {112, 0x7b97564d},  {113, 0xb7e5d2f3},  {114, 0xc53c1e49},  {115, 0x31264e98},  {116, 0xcc1f3b94},
    {117, 0xe0e85b08},  {118, 0x0215e1ff},  {119, 0x19826542},  {120, 0x7912dd3e},  {121, 0xe72cdf36},
    {122, 0x0bee65d4},  {123, 0xa3193200},  {124, 0x911e1479},  {125, 0x19583a44},  {126, 0xfc1f56ca},
    {127, 0xa4bfe3da},  {128, 0xbaec6d8a},  {129, 0x2a680f78},  {130, 0x249dabc8},  {131, 0x23fabf87},
    {132, 0x131089ad},  {133, 0x1b6aefc5},  {134, 0x35d72dd2},  {135, 0x2606490a},  {136, 0xa88ab7ac},
    {137, 0xb58426c2},  {138, 0x3316dab0},  {139, 0x0475dff2},  {140, 0xf2198552},  {141, 0xea9fe965},
    {142, 0xfe89707a},  {143, 0x6f5a03b5},  {144, 0x96b6b1f2},  {145, 0x92561d3d},  {146, 0x338c9725},
    {147, 0xa6e97d0f},  {148, 0x15cf1c3a},  {149, 0x26a655e5},  {150, 0xe0337f1d},  {151, 0x7bd041ac},
    {152, 0xafc281d4},  {153, 0x4b1dca62},  {154, 0x2f113be9},  {155, 0x47b1c4e0},  {156, 0xcc7ef685},
    {157, 0xdec1df90},  {158, 0xfa137716},  {159, 0x42209216},  {160, 0x50261be2},  {161, 0x9caa3ec5},
    {162, 0x51c12dde},  {163, 0x0fdf0009},  {164, 0x42d709ab},  {165, 0x03b986a8},  {166, 0xbc544b04},
    {167, 0xe65ed8cf},  {168, 0x4edb1820},  {169, 0x3b06af65},  {170, 0x3d0390f1},  {171, 0xfa3f53c6},
    {172, 0x19ff2041},  {173, 0x49a1f1c1},  {174, 0xa30f2bdb},  {175, 0x5652e6a4},  {176, 0x6ce5be95},
    {177, 0xa3278cba},  {178, 0x925c2e44},  {179, 0xaf890b79},  {180, 0xbdc28e78},  {181, 0x38a7595f},
    {182, 0xb0e5eaa1},  {183, 0xe91a14f5},  {184, 0xfccc6c8e},  {185, 0x1cfa6bf3},  {186, 0x24cb8844},
    {187, 0xca2e04cb},  {188, 0x62965eee},  {189, 0x7e6a1102},  {190, 0x7a2748ad},  {191, 0x263dd74a},
    {192, 0x9bd7fb89},  {193, 0x193f29b5},  {194, 0xdec03891},  {195, 0xce878318},  {196, 0x45213d28},
    {197, 0x166b4a9c},  {198, 0xb3bb5632},  {200, 0x341d3666},  {201, 0x29d73202},  {202, 0x460d6c5b},
    {203, 0xa67d9b89},  {204, 0xc5c963f1},  {205, 0x4974e3fd},  {206, 0xa485ed6b},  {207, 0x6cbe1f49},
    {208, 0x0a5db2e1},  {209, 0x4ad4000b},  {210, 0x49a003f5},  {211, 0x6a619ae4},  {212, 0xe5cd7f24},
    {213, 0x6170bca5},  {214, 0x72d8001e},  {215, 0x6b552a66},  {216, 0x9b956764},  {218, 0x73faf562},
    {219, 0x3885f045},  {220, 0x85ef5183},  {221, 0x9eabbbc1},  {222, 0x094fe6cd},  {223, 0x17f2dcf6},
    {243, 0x6215ec49},  {245, 0x6d7451d2},  {246, 0x04698b84},  {344, 0xcfbd95e5},  {345, 0x7253f4f7},
    {346, 0xc4c71bf1},  {347, 0xa83d13f8},  {348, 0x0a186242},  {371, 0x828db7ca},  {372, 0x61c2cc0e},
    {373, 0x23035562},  {374, 0x578e7c2e},  {375, 0xfc8028ee},  {376, 0xa3fc26f7},  {377, 0x89b2a795},
    {378, 0x19731cd1},  {379, 0xa417260a},  {380, 0xb24dfbae},  {381, 0x8d7594fa},  {382, 0xe99a265a},
    {383, 0xa542890e},  {384, 0x3614e859},  {385, 0xfc27bdb1},  {386, 0xe66c6d74},  {387, 0x62a0e143},
    {388, 0x4b245843},  {389, 0xe6412679},  {390, 0x84476287},  {391, 0x85a0ebae},  {392, 0x18aaf65a},
    {393, 0xb19f8535},  {394, 0x26014916},  {395, 0x0e6d7d32},  {396, 0x1f083970},  {397, 0x58e760c1},
    {398, 0xd358eadb},  {400, 0xa88e9356},  {401, 0xdd655afc},  {402, 0x47564fb7},  {403, 0x451b7996},
    {404, 0x43eec1a7},  {405, 0xca0d93ce},  {407, 0xbfb868c0},  {408, 0x7746359f},  {409, 0x8998525e},
    {410, 0x7e999fef},  {411, 0xfb8ce4ed},  {412, 0xbfc4e845},  {413, 0x083dbb61},  {414, 0xc59e76c6},
    {415, 0x452f685b},  {416, 0x4a144388},  {417, 0xcc62f6ef},  {418, 0x94467966},  {419, 0xeaf3c4ac},
    {420, 0xb89f9715},  {421, 0x20bb20e4},  {422, 0x6997e860},  {423, 0x1563d684},  {424, 0x7717e959},
    {425, 0x7ede8986},  {426, 0x8210c34f},  {427, 0xfc9ca9bb},  {428, 0x7516eff5},  {429, 0x332d6186},
    {430, 0x33914d92},  {431, 0x89f71355},  {432, 0x78d46d70},  {433, 0x0b331c3f},  {434, 0xd1a45911},
    {435, 0x79f13487},  {436, 0x886135da},  {437, 0xe9981af5},  {438, 0x7ec48bb0},  {439, 0x110978c7},
    {440, 0x61eb68a5},  {441, 0xb3513020},  {442, 0x1a502de1},  {443, 0xffa6f022},  {444, 0xa08a0b32},
    {445, 0x3b4c5454},  {446, 0x13226255},  {447, 0xbcc4cc08},  {448, 0xae21d02b},  {449, 0x0e3035aa},
    {450, 0xd40a00d6},  {451, 0xc97fb6f5},  {520, 0xa8304200},  {699, 0x0efadeeb},  {1210, 0x68d64283},
    {1812, 0x070833af}, {1813, 0xe8c25c27}, {2123, 0x561c97ab}, {2152, 0x6943a2df}, {3386, 0xa6e8f715},
    {8002, 0xb6576d69},
};

std::uint32_t digest(const std::string &text) {
    std::uint32_t hash = 0x811c9dc5;
    for (const char letter : text) {
        hash = (hash ^ static_cast<std::uint8_t>(letter)) * 0x1000193;
    }
    return hash;
}

TEST(PortNames, ofAllPorts) {
    for (unsigned port = 0; port <= 65535; ++port) {
        const PortNames names = portNames(static_cast<std::uint16_t>(port));
        const std::string row = std::to_string(port) + '|' + names.md + '|' + names.to;
        const auto named = digests.find(port);
        if (named == digests.end()) {
            EXPECT_EQ(row, std::to_string(port) + '|' + std::to_string(port) + '|') << "has no name";
        } else {
            EXPECT_EQ(digest(row), named->second) << row;
        }
    }
}

TEST(PortNames, ofAFewPorts) {
    const std::vector<std::tuple<std::uint16_t, std::string, std::string>> sample = {
        {1, "TCP Port Service Multiplexer", "TCPMUX"},
        {20, "File Transfer [Default Data]", "FTP-DATA"},
        {146, "ISO-IP0", "ISO-TP0"},
        {441, "decvms-sysmgt", "DECVMS-SYSMGt"},
        {443, "https  MCom", "HTTPS"},
        {447, "DDM-RFM", "DDM-DFM"},
        {1812, "RADIUS", "RADIUS"},
        {1813, "RADIUS Accounting", "RADIUS-ACC"},
        {2152, "GTP-U", "GTP-U"},
        {8002, "Torvane BTS O&M", "O&M"},
        {0, "0", ""},
        {4, "4", ""},
        {6, "6", ""},
        {8003, "8003", ""},
        {65535, "65535", ""},
    };
    for (const auto &[port, md, to] : sample) {
        EXPECT_EQ(portNames(port).md, md);
        EXPECT_EQ(portNames(port).to, to);
    }
}

} // namespace
} // namespace netfloor::test
