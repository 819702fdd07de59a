#pragma once

// The host's feature switch table: indexed by feature number, each entry points to a
// one-byte flag (or is null); a feature is on when its byte is non-zero.
constexpr int kFeatureListSize = 512;

extern "C" unsigned char* FeatureList[kFeatureListSize];
