// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Makes the pictures under ":/" known. They lie in a static library, whose resources no program
/// sees by itself; calling it again is free.
void registerPictures();
