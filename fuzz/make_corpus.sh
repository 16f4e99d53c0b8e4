#!/usr/bin/env bash
# Writes the seed corpora of the fuzz targets into fuzz/corpus/<target>/ from small sessions
# of orv_demo (built by ./scripts/build.sh). The seeds are kept in the repository; run this
# only to renew them.
set -euo pipefail
cd "$(dirname "$0")/.."
demo=${1:-build/orv_demo}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# Small sessions: one crossing the hour, one triggered, one on a 24-hour clock's last tenth.
"$demo" --out "$work" --name Road --duration 30 --start "2024-03-05 12:59:45" --no-audio >/dev/null
"$demo" --out "$work" --name Trig --duration 40 --start "2023-12-31 23:59:40" --no-audio \
        --triggered --seed 7 >/dev/null
"$demo" --out "$work" --name Short --duration 12 --start "2024-02-29 00:00:00" --no-audio \
        --calibration 0 >/dev/null

corpus=fuzz/corpus
rm -rf "$corpus"
mkdir -p "$corpus"/{info_file,level_data,session_run,command_line}_fuzz

for s in Road Trig Short; do
    cp "$work/$s/$s.inf" "$corpus/info_file_fuzz/$s.inf"
    for f in "$work/$s"/data.000/*.csv; do cp "$f" "$corpus/level_data_fuzz/${s}_$(basename "$f")"; done
done

# A run: options, then each session's information file and level files ("\n@@" + tag).
section() { printf '\n@@%s' "$1"; cat "$2"; }
{
    printf 'O-i 1 -leq 1'
    section I "$work/Road/Road.inf"
    for f in "$work/Road"/data.000/*.csv; do section L "$f"; done
} >"$corpus/session_run_fuzz/road_flat"
{
    printf 'O-bin -w C -leq 4 -p 10 50 90 -trg C'
    section I "$work/Trig/Trig.inf"
    for f in "$work/Trig"/data.000/*.csv; do section L "$f"; done
    section I "$work/Short/Short.inf"
    for f in "$work/Short"/data.000/*.csv; do section M "$f"; done
} >"$corpus/session_run_fuzz/two_sessions_bin"
{
    printf 'O-i 60'
    for n in 1 2; do
        section I "$work/Short/Short.inf"
        for f in "$work/Short"/data.000/*.csv; do section L "$f"; done
    done
} >"$corpus/session_run_fuzz/same_name_twice"

# Command lines: the arguments separated by NUL bytes.
args() {
    local name=$1
    shift
    printf '%s\0' "$@" | head -c -1 >"$corpus/command_line_fuzz/$name"
}
args demo -s demo/demo-session -d demo/results -leq 1 -i 1
args octave -s a b a -d out -oct 3 Z S -w C -p 90 10 50 -r
args filters -S x -D out -lpf 1000 A F -bpf 100 1000 C S -apf C N -trg c -npn front -bin -csv
args refused -s x -i -d out -leq 7 -p 10 abc -hpf 999 C S -d again

# Wave files: a name length byte, the name, then the file (short recordings, one with a LIST
# chunk, one continuation part, one whose data size disagrees with its length).
mkdir -p "$corpus/wave_fuzz"
python3 - "$corpus/wave_fuzz" <<'PY'
import math, struct, sys
def wave(samples, list_body=None, size_delta=0):
    data = b''.join(struct.pack('<h', int(8000 * math.sin(i / 7.0))) for i in range(samples))
    head = b'RIFF' + struct.pack('<I', 36 + len(data)) + b'WAVE'
    if list_body is not None:
        head += b'LIST' + struct.pack('<I', len(list_body)) + list_body
    head += b'fmt ' + struct.pack('<IHHIIHH', 16, 1, 1, 48000, 96000, 2, 16)
    return head + b'data' + struct.pack('<I', len(data) + size_delta) + data
seeds = {
    'plain': ('20200917_083000.wav', wave(14400)),
    'list': ('20200917_083000.wav', wave(9600, list_body=b'INFOISFT' + bytes(12))),
    'part': ('20200917_082958_001.wav', wave(14400)),
    'mismatch': ('20200917_83000.wav', wave(4800, size_delta=1000)),
}
for key, (name, body) in seeds.items():
    with open(f'{sys.argv[1]}/{key}', 'wb') as f:
        f.write(bytes([len(name)]) + name.encode() + body)
PY
