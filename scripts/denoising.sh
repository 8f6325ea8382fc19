#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# What docs/denoising.md tells: error at 16 samples before and after denoising, against a picture of
# many samples, on parts of the demo and of the gallery. Relative squared error, each channel's
# (value - converged)^2 / (converged^2 + 0.01), mean of the picture.
#   usage: scripts/denoising.sh [FOLDER]     pictures go there (default: build/denoising)
# SAMPLES sets the samples of the converged picture (default 512).
set -euo pipefail
cd "$(dirname "$0")/.."
out=${1:-build/denoising}
mkdir -p "$out"

mean_of() { # the arguments are what oiiotool does with the pictures
    oiiotool "$@" --ch R,G,B --printstats | awk '/Stats Avg/ {print ($3 + $4 + $5) / 3}'
}
error_of() { # picture, converged
    mean_of "$1" --ch R,G,B "$2" --ch R,G,B --sub --dup --mul \
        "$2" --ch R,G,B --dup --mul --addc 0.01 --div
}

printf '%-28s %9s %9s %6s %8s\n' scene before after ratio mean
for part in demo:500,240,708,360 gallery/corvid_Mtl_Ward_f05db29e:240,150,400,270 \
    gallery/corvid_Mtl_MetallicPaint:240,150,400,270 gallery/corvid_Mtl_Dielectric:240,150,400,270; do
    scene=${part%%:*}
    name=$(basename "$scene")
    zsi() { # output, samples, seed, layers
        build/zsi render "scenes/$scene.json" -q --crop "${part##*:}" \
            -o "$1" --samples "$2" --seed "$3" --layers "$4"
    }
    zsi "$out/$name-noisy.exr" 16 1001 halves
    [ -f "$out/$name-converged.exr" ] || zsi "$out/$name-converged.exr" "${SAMPLES:-512}" 5 depth
    build/zsi denoise -q "$out/$name-noisy.exr" -o "$out/$name-clean.exr"
    before=$(error_of "$out/$name-noisy.exr" "$out/$name-converged.exr")
    after=$(error_of "$out/$name-clean.exr" "$out/$name-converged.exr")
    awk -v name="$name" -v b="$before" -v a="$after" -v m="$(mean_of "$out/$name-noisy.exr")" \
        -v n="$(mean_of "$out/$name-clean.exr")" \
        'BEGIN {printf "%-28s %9.5f %9.5f %6.2f %+7.2f%%\n", name, b, a, b / a, 100 * (n / m - 1)}'
done
