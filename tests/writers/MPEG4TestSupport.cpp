#include "writers/MPEG4TestSupport.h"

#include <fcntl.h>
#include <unistd.h>

#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <thread>

#include <gtest/gtest.h>
#include <media/stagefright/MediaAdapter.h>
#include <media/stagefright/MediaBuffer.h>

using namespace android;

namespace mp4test {

WriteResult writeThroughAdapters(const sp<MPEG4Writer>& writer, const std::vector<sp<MetaData>>& formats,
                                 const std::vector<Pushed>& samples, MetaData* startParams,
                                 const std::function<void()>& afterStart) {
    WriteResult r;
    std::vector<sp<MediaAdapter>> adapters;
    for (const auto& f : formats) {
        adapters.push_back(new MediaAdapter(f));
        const status_t err = writer->addSource(adapters.back());
        if (err != OK) r.addSource = err;
    }
    r.start = writer->start(startParams);
    if (afterStart) afterStart();
    std::thread producer([&] {
        for (const Pushed& s : samples) {
            MediaBuffer* b = new MediaBuffer(s.bytes.size());
            if (!s.bytes.empty()) memcpy(b->data(), s.bytes.data(), s.bytes.size());
            b->meta_data().setInt64(kKeyTime, s.ptsUs);
            b->meta_data().setInt64(kKeyDecodingTime, s.dtsUs);
            if (s.sync) b->meta_data().setInt32(kKeyIsSyncFrame, 1);
            if (s.config) b->meta_data().setInt32(kKeyIsCodecConfig, 1);
            b->add_ref();
            adapters[s.track]->pushBuffer(b);
        }
    });
    producer.join();
    for (auto& a : adapters) a->stop();
    r.stop = writer->stop();
    return r;
}

bool haveTool(const char* name) {
    return runCommand(std::string("command -v ") + name + " >/dev/null 2>&1") == 0;
}

std::string tempDir() {
    const auto* info = ::testing::UnitTest::GetInstance()->current_test_info();
    std::string dir = ::testing::TempDir() + "mp4w_" + info->test_suite_name() + "_" + info->name();
    runCommand("rm -rf '" + dir + "' && mkdir -p '" + dir + "'");
    return dir;
}

int runCommand(const std::string& command, std::string* output) {
    FILE* p = popen(command.c_str(), "r");
    if (p == nullptr) return -1;
    char buf[4096];
    size_t n;
    while ((n = fread(buf, 1, sizeof(buf), p)) > 0) {
        if (output) output->append(buf, n);
    }
    const int status = pclose(p);
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

bool probe(const std::string& path, const std::string& entries, Flat* out) {
    std::string text;
    if (runCommand("ffprobe -v error " + entries + " -of flat '" + path + "'", &text) != 0) return false;
    std::istringstream in(text);
    std::string line;
    while (std::getline(in, line)) {
        const size_t eq = line.find('=');
        if (eq == std::string::npos) continue;
        std::string value = line.substr(eq + 1);
        if (value.size() >= 2 && value.front() == '"' && value.back() == '"') value = value.substr(1, value.size() - 2);
        (*out)[line.substr(0, eq)] = value;
    }
    return true;
}

bool decodesCleanly(const std::string& path, std::string* errors) {
    errors->clear();
    const int rc = runCommand("ffmpeg -nostdin -v error -i '" + path + "' -f null - 2>&1", errors);
    return rc == 0 && errors->empty();
}

int64_t parseSecondsToUs(const std::string& text) {
    // "-0.023220": exact decimal parsing, no floating point.
    const bool negative = !text.empty() && text[0] == '-';
    const std::string t = negative ? text.substr(1) : text;
    const size_t dot = t.find('.');
    int64_t us = std::stoll(t.substr(0, dot)) * 1000000;
    if (dot != std::string::npos) {
        std::string frac = t.substr(dot + 1);
        frac.resize(6, '0');
        us += std::stoll(frac);
    }
    return negative ? -us : us;
}

std::vector<Packet> packets(const std::string& path) {
    Flat f;
    std::vector<Packet> out;
    if (!probe(path, "-show_entries packet=stream_index,pts_time,dts_time,size,pos,flags", &f)) return out;
    for (size_t i = 0;; ++i) {
        const std::string k = "packets.packet." + std::to_string(i) + ".";
        if (!f.count(k + "size")) break;
        Packet p{std::stoi(f[k + "stream_index"]), parseSecondsToUs(f[k + "pts_time"]),
                 parseSecondsToUs(f[k + "dts_time"]), std::stoul(f[k + "size"]), std::stoll(f[k + "pos"]),
                 f[k + "flags"].find('K') != std::string::npos};
        out.push_back(p);
    }
    return out;
}

std::vector<uint8_t> readFile(const std::string& path, int64_t offset, size_t size) {
    std::ifstream in(path, std::ios::binary);
    in.seekg(0, std::ios::end);
    const int64_t total = in.tellg();
    if (offset > total) return {};
    if (size == SIZE_MAX || offset + int64_t(size) > total) size = size_t(total - offset);
    std::vector<uint8_t> bytes(size);
    in.seekg(offset);
    in.read(reinterpret_cast<char*>(bytes.data()), std::streamsize(size));
    return bytes;
}

std::vector<uint8_t> extradata(const std::string& path, int stream) {
    std::string text;
    runCommand("ffprobe -v error -show_streams -show_data -select_streams " + std::to_string(stream) + " '" + path +
                   "'",
               &text);
    std::vector<uint8_t> out;
    std::istringstream in(text.substr(std::min(text.size(), text.find("extradata=\n") + 11)));
    std::string line;
    // Hex dump lines: "00000000: 0164 000b ...  text"
    while (std::getline(in, line) && line.size() > 10 && line[8] == ':') {
        const std::string hex = line.substr(10, 40);
        for (size_t i = 0; i + 1 < hex.size(); ++i) {
            if (hex[i] == ' ') continue;
            out.push_back(static_cast<uint8_t>(std::stoi(hex.substr(i, 2), nullptr, 16)));
            ++i;
        }
    }
    return out;
}

std::vector<uint8_t> toAnnexB(const std::vector<uint8_t>& in) {
    std::vector<uint8_t> out;
    for (size_t pos = 0; pos + 4 <= in.size();) {
        const size_t n = (size_t(in[pos]) << 24) | (in[pos + 1] << 16) | (in[pos + 2] << 8) | in[pos + 3];
        pos += 4;
        out.insert(out.end(), {0, 0, 0, 1});
        out.insert(out.end(), in.begin() + long(pos), in.begin() + long(std::min(in.size(), pos + n)));
        pos += n;
    }
    return out;
}

std::vector<uint8_t> recordToAnnexB(const std::vector<uint8_t>& r, bool hevc) {
    std::vector<uint8_t> out;
    auto unit = [&](size_t& pos) {
        const size_t n = (size_t(r.at(pos)) << 8) | r.at(pos + 1);
        out.insert(out.end(), {0, 0, 0, 1});
        out.insert(out.end(), r.begin() + long(pos + 2), r.begin() + long(pos + 2 + n));
        pos += 2 + n;
    };
    if (hevc) {
        size_t pos = 23;
        for (int a = 0, arrays = r.at(22); a < arrays; ++a) {
            const int count = (r.at(pos + 1) << 8) | r.at(pos + 2);
            pos += 3;
            for (int i = 0; i < count; ++i) unit(pos);
        }
    } else {
        size_t pos = 6;
        for (int i = 0, n = r.at(5) & 0x1F; i < n; ++i) unit(pos);
        for (int i = 0, n = r.at(pos++); i < n; ++i) unit(pos);
    }
    return out;
}

std::vector<Pushed> samplesOf(const std::string& path, bool annexB, bool configBuffers) {
    Flat streams;
    probe(path, "-show_entries stream=codec_type,codec_name", &streams);
    std::vector<Pushed> out;
    std::vector<bool> video;
    for (int s = 0; streams.count("streams.stream." + std::to_string(s) + ".codec_type"); ++s) {
        const std::string key = "streams.stream." + std::to_string(s);
        video.push_back(streams[key + ".codec_type"] == "video");
        if (!configBuffers) continue;
        std::vector<uint8_t> config = extradata(path, s);
        if (video.back() && annexB) config = recordToAnnexB(config, streams[key + ".codec_name"] == "hevc");
        out.push_back({size_t(s), config, 0, 0, false, true});
    }
    const std::vector<uint8_t> file = readFile(path);
    for (const Packet& p : packets(path)) {
        std::vector<uint8_t> bytes(file.begin() + p.pos, file.begin() + p.pos + long(p.size));
        if (annexB && video.at(size_t(p.stream))) bytes = toAnnexB(bytes);
        out.push_back({size_t(p.stream), bytes, p.ptsUs, p.dtsUs, p.key, false});
    }
    return out;
}

std::map<std::string, std::vector<uint8_t>> childBoxes(const std::vector<uint8_t>& file, const std::string& path) {
    std::map<std::string, std::vector<uint8_t>> out;
    size_t begin = 0, end = file.size();
    std::string rest = path;
    while (!rest.empty()) {
        const std::string want = rest.substr(0, rest.find('/'));
        bool found = false;
        for (size_t pos = begin; pos + 8 <= end;) {
            const uint64_t size = (uint64_t(file[pos]) << 24) | (file[pos + 1] << 16) | (file[pos + 2] << 8) | file[pos + 3];
            if (size < 8 || pos + size > end) break;
            if (std::string(file.begin() + long(pos + 4), file.begin() + long(pos + 8)) == want) {
                begin = pos + 8;
                end = pos + size;
                found = true;
                break;
            }
            pos += size;
        }
        if (!found) return out;
        rest = rest.find('/') == std::string::npos ? "" : rest.substr(rest.find('/') + 1);
    }
    for (size_t pos = begin; pos + 8 <= end;) {
        const uint64_t size = (uint64_t(file[pos]) << 24) | (file[pos + 1] << 16) | (file[pos + 2] << 8) | file[pos + 3];
        if (size < 8 || pos + size > end) break;
        out[std::string(file.begin() + long(pos + 4), file.begin() + long(pos + 8))] =
            std::vector<uint8_t>(file.begin() + long(pos + 8), file.begin() + long(pos + size));
        pos += size;
    }
    return out;
}

}  // namespace mp4test
