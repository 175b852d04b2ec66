#!/usr/bin/env bash
# apply_filter_test.sh PROGRAM DATA SCRATCH: runs the example host with good and with bad command lines.
set -u
program=$1 data=$2 scratch=$3
output="$scratch/out.png"
source "$(dirname "$0")/support/program_test.sh"

photograph="$data/astronaut.png"
bilateral=(--filter FastBilateralBlur)

accepted "${bilateral[@]}" "$photograph" "$scratch/reference.png"
for variation in "--threads 1" "--threads 8" "--async" "--repeat 3" "--async --repeat 2"; do
    # shellcheck disable=SC2086
    accepted "${bilateral[@]}" $variation "$photograph" "$scratch/same.png"
    cmp -s "$scratch/reference.png" "$scratch/same.png" || fail "another picture with $variation"
done
[ "$(grep -c '^frame [12]: [0-9.]* ms$' "$scratch/stdout")" -eq 2 ] || fail "times: $(cat "$scratch/stdout")"
for precision in 8 16 32f; do
    for extension in png tif jpg exr; do
        accepted "${bilateral[@]}" --precision $precision "$photograph" "$scratch/out.$extension"
        [ -s "$scratch/out.$extension" ] || fail "no out.$extension"
    done
done
accepted "${bilateral[@]}" --set spatialSigma=4,4 --set rangeSigma=0.1 --set colorize=true \
    "$photograph" "$scratch/colour.png"
cmp -s "$scratch/reference.png" "$scratch/colour.png" && fail "colorize changes nothing"
for filter in SimpleBilateralCPU RGBToLABCPU LABToRGBCPU FastBilateralFilter; do
    accepted --filter $filter "$data/chelsea.png" "$scratch/$filter.png"
done

# On OpenGL an opaque photograph that is premultiplied stays as it is.
for variation in "" "--async --repeat 2"; do
    # shellcheck disable=SC2086
    accepted --target gl --filter premultiply $variation "$photograph" "$scratch/gl.png"
    accepted --target gl --filter unpremultiply "$scratch/gl.png" "$scratch/gl_again.png"
    cmp -s "$scratch/gl.png" "$scratch/gl_again.png" || fail "another picture on gl with $variation"
done
for precision in 16 32f; do
    accepted --target gl --filter premultiply --precision $precision "$photograph" "$scratch/gl.exr"
    [ -s "$scratch/gl.exr" ] || fail "no gl.exr with precision $precision"
done
accepted --target gl --filter scaleDown4channel "$photograph" "$scratch/gl_dark.png"
cmp -s "$scratch/gl.png" "$scratch/gl_dark.png" && fail "scaleDown4channel changes nothing"

# The bilateral blur runs on both targets, and looks alike.
for filter in FastBilateralBlur FastBilateralFilter; do
    accepted --target gl --filter $filter --set spatialSigma=4,4 --set colorize=true "$photograph" "$scratch/gl_blur.png"
    cmp -s "$photograph" "$scratch/gl_blur.png" && fail "$filter changes nothing on gl"
done
# Colour there and back in 16 bits; codes as characters and as numbers.
colour=(--filter ColorspaceTransformer --precision 16)
for target in cpu gl; do
    accepted "${colour[@]}" --target $target --set srcProfile=sRGB --set dstProfile=0x41533938 \
        "$photograph" "$scratch/wide_$target.tif"
    accepted "${colour[@]}" --target $target --set srcProfile=1095973176 --set dstProfile=sRGB \
        "$scratch/wide_$target.tif" "$scratch/back_$target.tif"
    [ -s "$scratch/back_$target.tif" ] || fail "no back_$target.tif"
done
accepted --filter ColorspaceTransformer --set srcProfile=sRGB --set dstProfile=P3 "$photograph" "$scratch/p3.png"
cmp -s "$photograph" "$scratch/p3.png" && fail "sRGB to P3 changes nothing"
# The profile that stands in a file is the source where none is named, and the default is where none stands there.
for picture in astronaut coffee; do
    accepted --filter ColorspaceTransformer --set dstProfile=sRGB "$data/$picture.png" "$scratch/own_$picture.png"
    accepted --filter ColorspaceTransformer --set srcProfile=0x41533938 --set dstProfile=sRGB \
        "$data/$picture.png" "$scratch/named_$picture.png"
done
cmp -s "$scratch/own_astronaut.png" "$scratch/named_astronaut.png" && fail "the profile in the file changes nothing"
cmp -s "$scratch/own_coffee.png" "$scratch/named_coffee.png" || fail "a file without a profile has another source"
refused 2 'is a colour space, which "nonsense" is not' --filter ColorspaceTransformer --set srcProfile=nonsense \
    "$photograph" "$output"
refused 1 'Cannot make src profile from code' --filter ColorspaceTransformer --set srcProfile=none \
    "$photograph" "$output"
refused 1 'Cannot make dst profile from code' --filter ColorspaceTransformer --set dstProfile=none \
    "$photograph" "$output"

accepted --list
grep -A1 '^FastBilateralBlur' "$scratch/stdout" | grep -q 'runs on cpu, gl' || fail "targets of FastBilateralBlur"
grep -A1 '^FastBilateralFilter' "$scratch/stdout" | grep -q 'runs on cpu, gl' || fail "targets of FastBilateralFilter"
for line in 'FastBilateralBlur  (Motion Loft, Norvane Works, version 1)' \
    'spatialSigma  float2  default 10,10  from 0.1,0.1 to 100,100' 'rangeSigma  float  default 0.15' \
    'colorize  bool  default false' 'input src' 'RGBToLABCPU' 'SimpleBilateralCPU' \
    'ColorspaceTransformer  (com.norvane.orvo, Norvane, version 1)' 'srcProfile  int  default 0x41533938' \
    'premultiply  (ORVO, Norvane, version 1)' 'runs on cpu' 'runs on gl' \
    'MirelCheckerBoardGPU  (ImageFlow, Norvane, version 1)' 'checkerSize  float2  default 16,16' \
    'MirelGamutComposite  (ImageFlow, Norvane, version 1)' 'input GamutTestResultInputImage' \
    'VantleFilterGPU  (ImageFlow, Norvane, version 1)' \
    'MirelToneMappingGPU  (ImageFlow, Norvane, version 1)' 'exposure  float  default 0  from -20 to 20'; do
    grep -qF "$line" "$scratch/stdout" || fail "no \"$line\" in the list"
done
accepted --help
grep -q '^Usage: apply_filter' "$scratch/stdout" || fail "no usage in --help"

refused 2 'There is no filter "Nonsense"' --filter Nonsense "$photograph" "$output"
refused 2 'has no parameter "sigma"' "${bilateral[@]}" --set sigma=1 "$photograph" "$output"
refused 2 'The filter "SimpleBilateralCPU" does not run on gl (--list shows the targets)' --filter SimpleBilateralCPU \
    --target gl "$photograph" "$output"
refused 2 'The filter "premultiply" does not run on cpu (--list shows the targets)' --filter premultiply \
    "$photograph" "$output"
refused 2 '--target is cpu or gl, not "gpu"' --target gpu --filter premultiply "$photograph" "$output"
refused 2 'is of type float2, which "10" is not' "${bilateral[@]}" --set spatialSigma=10 "$photograph" "$output"
refused 2 'is of type float, which "wide" is not' "${bilateral[@]}" --set rangeSigma=wide "$photograph" "$output"
refused 2 'is of type bool, which "yes" is not' "${bilateral[@]}" --set colorize=yes "$photograph" "$output"
refused 1 'no such file' "${bilateral[@]}" "$scratch/none.png" "$output"
refused 1 'Cannot read' "${bilateral[@]}" "$0" "$output"
refused 1 'no such folder' "${bilateral[@]}" "$photograph" "$scratch/none/out.png"
refused 1 'Cannot write' "${bilateral[@]}" "$photograph" "$scratch/out.nonsense"

# A value outside its interval is a warning: the picture is written.
rm -f "$output"
"$program" "${bilateral[@]}" --set rangeSigma=2 "$photograph" "$output" 2> "$scratch/stderr" ||
    fail "a value outside its interval is refused"
grep -qF 'warning: rangeSigma=2 is outside 0.01 to 1' "$scratch/stderr" || fail "warning: $(cat "$scratch/stderr")"
[ -s "$output" ] || fail "no picture after a warning"

# An interrupt cancels the frame.
interrupted TERM "${bilateral[@]}" --async --repeat 100000 "$photograph" "$output"

finish
