/* SPDX-License-Identifier: MIT
   Id of the manifest resource that names this program as the Ruby engine's server. The resource
   compiler reads this file as well. Id 1 would be the program's own manifest. */
#pragma once

#define kEngineManifest 20
