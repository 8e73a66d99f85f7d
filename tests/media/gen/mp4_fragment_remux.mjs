// Copies the packets of an MP4 into a fragmented MP4 written by the npm
// "mediabunny" package (no codec runs: the packets keep their bytes and times).
//   node mp4_fragment_remux.mjs IN OUT [FRAGMENT_SECONDS]
import { readFileSync, writeFileSync } from 'node:fs';
import {
  Input, Output, ALL_FORMATS, BufferSource, BufferTarget, Mp4OutputFormat,
  EncodedPacketSink, EncodedVideoPacketSource, EncodedAudioPacketSource,
} from 'mediabunny';

const [inPath, outPath, seconds = '0.5'] = process.argv.slice(2);
const input = new Input({ source: new BufferSource(readFileSync(inPath)), formats: ALL_FORMATS });
const output = new Output({
  format: new Mp4OutputFormat({ fastStart: 'fragmented', minimumFragmentDuration: Number(seconds) }),
  target: new BufferTarget(),
});
const copies = [];
for (const track of await input.getTracks()) {
  const config = await track.getDecoderConfig();
  const source = track.isVideoTrack() ? new EncodedVideoPacketSource(track.codec)
                                      : new EncodedAudioPacketSource(track.codec);
  if (track.isVideoTrack()) output.addVideoTrack(source); else output.addAudioTrack(source);
  copies.push({ track, source, config });
}
await output.start();
// One track after the other would hold every packet of the first in memory
// until the second catches up; interleave by time instead.
const iterators = copies.map((c) => ({ ...c, it: new EncodedPacketSink(c.track).packets(), first: true }));
for (const c of iterators) c.next = await c.it.next();
for (;;) {
  const live = iterators.filter((c) => !c.next.done);
  if (live.length === 0) break;
  const c = live.reduce((a, b) => (b.next.value.timestamp < a.next.value.timestamp ? b : a));
  await c.source.add(c.next.value, c.first ? { decoderConfig: c.config } : undefined);
  c.first = false;
  c.next = await c.it.next();
}
await output.finalize();
writeFileSync(outPath, Buffer.from(output.target.buffer));
