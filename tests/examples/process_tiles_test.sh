#!/usr/bin/env bash
# process_tiles_test.sh PROGRAM DATA SCRATCH: runs the tile example with good and with bad command lines.
set -u
program=$1 data=$2 scratch=$3
output="$scratch/out.tif"
source "$(dirname "$0")/support/program_test.sh"

photograph="$data/astronaut.png"
bilateral=(--filter FastBilateralBlur --set spatialSigma=4,4 --set colorize=true)

accepted "${bilateral[@]}" "$photograph" "$scratch/reference.tif"
for variation in "--threads 1" "--tile 128 --threads 3"; do
    # shellcheck disable=SC2086
    accepted "${bilateral[@]}" $variation "$photograph" "$scratch/other.tif"
    [ -s "$scratch/other.tif" ] || fail "no picture with $variation"
done
accepted "${bilateral[@]}" --tile 128 "$photograph" "$scratch/out.exr"
accepted "${bilateral[@]}" --tile 128 "$scratch/out.exr" "$scratch/again.TIFF"
accepted --filter premultiply --target gl --tile 200 "$photograph" "$scratch/gl.tif"
cp "$photograph" "$scratch/-c.png"
(cd "$scratch" && accepted --filter=FastBilateralBlur --tile=128 -- -c.png -c.tif && [ -s ./-c.tif ]) || fail "files with a dash"
# The input is its own output.
cp "$scratch/reference.tif" "$scratch/self.tif"
accepted "${bilateral[@]}" "$scratch/self.tif" "$scratch/self.tif"
cmp -s "$scratch/reference.tif" "$scratch/self.tif" && fail "the file is as it was"
accepted --help
grep -q '^Usage: process_tiles' "$scratch/stdout" || fail "no usage in --help"

refused 2 'There is no filter "Nonsense"' --filter Nonsense "$photograph" "$output"
refused 2 'has no parameter "sigma"' --filter FastBilateralBlur --set sigma=1 "$photograph" "$output"
refused 2 'is of type float2, which "10" is not' --filter FastBilateralBlur --set spatialSigma=10 "$photograph" "$output"
refused 2 'The filter "premultiply" does not run on cpu' --filter premultiply "$photograph" "$output"
refused 2 'The filter "SimpleBilateralCPU" does not run on gl' --filter SimpleBilateralCPU --target gl "$photograph" "$output"
# A value that fails has its own words, and ends no search for a tile that is small enough.
for target in cpu gl; do
    refused 1 'Cannot make src profile from code' --filter ColorspaceTransformer --target $target --set srcProfile=Nope \
        "$photograph" "$output"
done
refused 2 'The memory does not suffice: --memory-limit has to be' "${bilateral[@]}" --memory-limit 1 "$photograph" "$output"
refused 2 'Tiles of every size are refused' --filter FastBilateralBlur --target gl --set spatialSigma=0.1,0.1 \
    --set rangeSigma=0.01 --memory-limit 4096 "$photograph" "$output"
refused 1 'no such file' "${bilateral[@]}" "$scratch/none.png" "$output"
refused 1 'Cannot read' "${bilateral[@]}" "$0" "$output"
refused 1 'no such folder' "${bilateral[@]}" "$photograph" "$scratch/none/out.tif"
refused 1 'tiles go into TIFF and EXR files' "${bilateral[@]}" "$photograph" "$scratch/out.png"
refused 1 'tiles go into TIFF and EXR files' "${bilateral[@]}" "$photograph" "$scratch/out"
refused 1 'it is a folder' "${bilateral[@]}" "$photograph" "$scratch"
refused 1 'it is a folder' "${bilateral[@]}" "$scratch" "$output"
refused 1 "Cannot write /proc/out.tif: " "${bilateral[@]}" "$photograph" /proc/out.tif
mkfifo "$scratch/pipe.tif"
refused 1 'it is not a regular file' "${bilateral[@]}" "$photograph" "$scratch/pipe.tif"
refused 1 'it is not a regular file' "${bilateral[@]}" "$scratch/pipe.tif" "$output"

# A file that ends too early.
head -c 300000 "$scratch/reference.tif" > "$scratch/short.tif"
refused 1 "Cannot read $scratch/short.tif" "${bilateral[@]}" "$scratch/short.tif" "$output"

# No room: files may not grow beyond 64 KiB.
with_little_room() { (trap '' XFSZ; ulimit -f 64; exec "$program" "$@"); }
refused_command 1 "Cannot write $output" with_little_room "${bilateral[@]}" "$photograph" "$output"

# Interrupts: a thousand tiles, and for each the whole photograph has to be computed, so that what is sent is there long
# before the end.
for signal in INT TERM HUP; do
    interrupted $signal "${bilateral[@]}" --set spatialSigma=100,100 --tile 16 "$photograph" "$output"
done

finish
