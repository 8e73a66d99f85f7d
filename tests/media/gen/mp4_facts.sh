# ffprobe facts of an MP4 for the extractor tests, sourced by the MP4
# generators: one "stream" line per track and one "packet" line per sample
# (times in microseconds, rounded):
#   format DURATION LOCATION
#   stream INDEX CODEC TAG DURATION WIDTH HEIGHT RATE CHANNELS ROTATION(ccw)
#   packet STREAM PTS DTS SIZE KEY
facts() {
  ffprobe -v error -show_streams -show_packets -show_format -of json "$1" | jq -r '
    def us(t; tb): (t * 1000000 * (tb | split("/") | (.[0] | tonumber) / (.[1] | tonumber))) | round;
    .streams as $s |
    def secs(t): ((t // "0") | tonumber * 1000000) | round;
    "format \(secs(.format.duration)) \(.format.tags.location // "-")",
    ($s[] | "stream \(.index) \(.codec_name) \(.codec_tag_string) \(secs(.duration)) \(.width // 0) \(.height // 0) \(.sample_rate // 0) \(.channels // 0) \([.side_data_list[]? | .rotation // empty][0] // 0)"),
    (.packets[] | . as $p | $s[$p.stream_index].time_base as $tb |
      "packet \($p.stream_index) \(us($p.pts; $tb)) \(us($p.dts; $tb)) \($p.size) \(if ($p.flags | startswith("K")) then 1 else 0 end)")'
}
