// VLM_EXPORT marks what libvlm hands to other programs; everything else in it is hidden. The
// library's version script names the same things once more, so that nothing gets out by accident.

#pragma once

#define VLM_EXPORT __attribute__((visibility("default")))
