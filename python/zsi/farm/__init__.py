# SPDX-License-Identifier: Apache-2.0
"""One picture, a turntable, a sequence or a sweep on many machines, over Dask distributed.

``zsi farm`` and ``python3 -m zsi.farm`` are this package's command (docs/farm.md). Its parts:

- pack: a scene with all its files, by what they hold
- plan: a picture in units, tiles by blocks of samples
- worker: what workers run
- run: sends units out, merges what comes back, sees to workers that fail
- frames: the pictures of a turntable, a sequence or a sweep
"""
