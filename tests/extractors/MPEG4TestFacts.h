#ifndef TESTS_MPEG4_TEST_FACTS_H
#define TESTS_MPEG4_TEST_FACTS_H

// What ffprobe recorded about a test file (tests/media/gen/mp4_facts.sh).

#include <cstdint>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include "MPEG4TestRead.h"

namespace mp4test {
// Apart from the writer tests' types of the same names.
namespace facts {

struct Packet {
    int64_t pts, dts;
    uint32_t size;
    bool key;
};
struct Stream {
    std::string codec;
    int64_t durationUs;
    int32_t width, height, rate, channels, rotationCcw;
    std::vector<Packet> packets;
};
struct Facts {
    int64_t durationUs = 0;
    std::string location;
    std::vector<Stream> streams;
};

inline Facts LoadFacts(const std::string& name) {
    Facts f;
    std::ifstream in(MediaPath(name) + ".facts");
    std::string line;
    while (std::getline(in, line)) {
        std::istringstream s(line);
        std::string kind, tag;
        s >> kind;
        if (kind == "format") {
            s >> f.durationUs >> f.location;
        } else if (kind == "stream") {
            Stream st;
            int index;
            s >> index >> st.codec >> tag >> st.durationUs >> st.width >> st.height >> st.rate >> st.channels >>
                st.rotationCcw;
            f.streams.push_back(st);
        } else if (kind == "packet") {
            size_t index;
            int key;
            Packet p;
            s >> index >> p.pts >> p.dts >> p.size >> key;
            p.key = key != 0;
            if (index < f.streams.size()) f.streams[index].packets.push_back(p);
        }
    }
    return f;
}

}  // namespace facts
}  // namespace mp4test

#endif
