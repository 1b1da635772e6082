#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "coder/HuffmanPathTree.hpp"
#include "tests/support/Bytes.hpp"
#include "tests/support/Model.hpp"

// Short ways to say what most tests need of the library.
namespace support {

using CoderPtr = std::unique_ptr<tessel::HuffmanPathTree>;
using model::Texts;

// A coder with this code and no paths.
CoderPtr coderWith(const std::u16string& characters,
                   const std::vector<double>& frequencies);

// a = 00, c = 01, b = 10, d = 11.
CoderPtr fourLetterCoder();

// "10" for true, false. Throws what codeOf throws.
std::string codeText(const tessel::HuffmanPathTree& coder, char16_t character);

// Adds one batch, encoded as if the hardware ran that many threads.
void addBatches(tessel::HuffmanPathTree& coder, std::vector<Texts> folders,
                std::vector<Texts> files, unsigned hardwareThreads = 2);
void addBatch(tessel::HuffmanPathTree& coder, const Texts& folder,
              const Texts& files);

// Adds one whole path of these texts.
void addWhole(tessel::HuffmanPathTree& coder, const Texts& texts);

// The encoded texts, with nothing counted in maxCodeBytes.
tessel::Components encodedBy(const tessel::HuffmanPathTree& coder,
                             const Texts& texts);
Texts decodedBy(const tessel::HuffmanPathTree& coder,
                const tessel::Components& components);

// Every path from a reset on, as texts. Stops after `most` paths.
std::vector<Texts> iterated(tessel::HuffmanPathTree& coder,
                            std::size_t most = 100000);

// What getPath gives, or nothing if it throws std::out_of_range.
std::optional<model::Found> found(const tessel::HuffmanPathTree& coder,
                                  const std::vector<double>& numbers);

Bytes formOf(const tessel::HuffmanPathTree& coder, bool compress);

// A fresh coder from a stored form, with its code when `like` has one.
CoderPtr restoredFrom(Bytes form, bool compress,
                      const tessel::HuffmanPathTree& like);

// The tree's node codes and values.
std::pair<Bytes, tessel::Components> storedTree(const tessel::BPathTree& tree);

std::vector<tessel::PathTrack> tracksOf(const tessel::HuffmanPathTree& coder);

// Empty if the coder is what the model says, else what differs first.
std::string differenceFrom(const model::Coder& expected,
                           const tessel::HuffmanPathTree& coder);

// The first invariant that the coder breaks; empty if it keeps all. Loaded
// tells that it may hold whatever a reader accepts.
std::string brokenInvariant(const tessel::HuffmanPathTree& coder,
                            bool loaded = false);

}  // namespace support
