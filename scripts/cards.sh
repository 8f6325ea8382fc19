#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Writes a page of all classes, each a card with its picture, what it models, what that stands on and
# its parameters: what `zsi info --json` says, and the pictures of docs/gallery.
#   usage: scripts/cards.sh [FOLDER]    out/cards by default
set -euo pipefail
cd "$(dirname "$0")/.."
zsi=${ZSI:-build/zsi}
[ -x "$zsi" ] || { echo "cards: build first (scripts/demo.sh)" >&2; exit 1; }
exec /usr/bin/python3 -B scripts/lib/cards.py "$zsi" docs "${1:-out/cards}"
