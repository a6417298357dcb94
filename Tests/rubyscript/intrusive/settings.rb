# SPDX-License-Identifier: MIT
# Frozen objects, hooks and settings that belong to Ruby as a whole.
# ---
$; = "x"; $, = "y"; $/ = "z"; $\ = "e"
# ---
GC.disable; GC.stress = true
# ---
$LOAD_PATH.clear
# --- interrupt
loop { }
# --- > item.f('["constant", nil]')
module Found; end
@item.f([defined?(Found), defined?(Leaked)].inspect)
