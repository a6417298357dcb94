/* SPDX-License-Identifier: MIT
   The number of the manifest resource that names this program as the Ruby engine's server; also read
   by the resource compiler. 1 would be the program's own manifest. */
#pragma once

#define kEngineManifest 20
