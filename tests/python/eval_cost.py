# SPDX-License-Identifier: Apache-2.0
"""Calls of the Ward material from numpy cost little more than in a loop in C++.

usage: eval_cost.py EVAL_LOOP [CALLS]. Processor time of one thread, the least of several runs taken
in turns; fails above 1.3 times.
"""

import subprocess
import sys
import time

import numpy as np
import zsi

calls = int(sys.argv[2]) if len(sys.argv) > 2 else 1_000_000
random = np.random.default_rng(1)


def directions():
    z, phi = random.uniform(0.05, 1, calls), random.uniform(0, 2 * np.pi, calls)
    r = np.sqrt(1 - z * z)
    return np.stack([r * np.cos(phi), r * np.sin(phi), z], -1).astype(np.float32)


wi, wo = directions(), directions()
ward = zsi.material("corvid_Mtl_Ward", u_roughValue=0.2)
numpy_cost, loop_cost = [], []
for _ in range(5):
    loop_cost.append(float(subprocess.check_output([sys.argv[1], str(calls)])))
    begun = time.process_time()
    ward.eval(wi, wo, threads=1)
    numpy_cost.append((time.process_time() - begun) * 1e9 / calls)
ratio = min(numpy_cost) / min(loop_cost)
print(f"{calls} calls: numpy {min(numpy_cost):.1f} ns, loop {min(loop_cost):.1f} ns, {ratio:.2f}")
sys.exit(ratio > 1.3)
