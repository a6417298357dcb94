// SPDX-License-Identifier: MIT
// Facts about the product that its maker chooses. Each can be set when configuring the build (the
// CMake cache variables of the same names); the defaults use a domain reserved for examples.
#pragma once

// Where the message about a fault asks users to send their report.
#ifndef SCRIPTRUBY_SUPPORT_ADDRESS
#define SCRIPTRUBY_SUPPORT_ADDRESS "support@tarn.example"
#endif

// Where the message about a missing engine sends users for the Ruby engine ...
#ifndef SCRIPTRUBY_RUBY_ENGINE_PAGE
#define SCRIPTRUBY_RUBY_ENGINE_PAGE "https://tarn.example/download/rubyscript"
#endif

// ... and for the Windows Script Host languages.
#ifndef SCRIPTRUBY_SCRIPT_HOST_PAGE
#define SCRIPTRUBY_SCRIPT_HOST_PAGE "https://tarn.example/download/windows-script-host"
#endif
