// The documents that property lists are measured with. Always the same, from fixed seeds.
#pragma once

#include <array>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <string>
#include <string_view>
#include <vector>

#include "plist/PropertyList.h"

namespace appsync::bench {

/// A corpus: one document, or many of a kind.
using Documents = std::vector<plist::Value>;

namespace detail {

constexpr std::array<std::string_view, 12> kWords = {"Lake",   "Café", "Tower",  "Notes", "旅行",  "Runner",
                                                     "Sudoku", "Über", "Camera", "Chess", "Piano", "Weather"};

inline Bytes randomBytes(std::mt19937_64& random, std::size_t size) {
  Bytes bytes(size);
  for (std::byte& byte : bytes)
    byte = static_cast<std::byte>(random());
  return bytes;
}

inline std::string_view word(std::mt19937_64& random) {
  return kWords[random() % kWords.size()];
}

inline std::string identifier(std::mt19937_64& random, std::size_t number) {
  return "com.maker" + std::to_string(random() % 900) + ".product" + std::to_string(number);
}

inline plist::Value metadataValue(std::mt19937_64& random, int depth) {
  switch (random() % (depth > 1 ? 6 : 8)) {
    case 0:
      return random() % 2 == 0;
    case 1:
      return random() >> (random() % 40);
    case 2:
      return static_cast<double>(random() % 100000) / 64;
    case 3:
      return plist::Date{static_cast<double>(random() % 700000000)};
    case 4:
      return identifier(random, random() % 100000);
    case 5:
      return std::string(word(random)) + " " + std::string(word(random)) + " of the " + std::string(word(random));
    case 6: {
      plist::Array list;
      for (std::size_t i = random() % 6; i > 0; --i)
        list.push_back(metadataValue(random, depth + 1));
      return list;
    }
    default: {
      plist::Dictionary nested;
      for (std::size_t i = 0; i < 6; ++i)
        nested.set("nestedKey" + std::to_string(i), metadataValue(random, depth + 1));
      return nested;
    }
  }
}

}  // namespace detail

/// A todo list of 10,000 entries; a quarter of the names is not ASCII.
inline Documents makeTodo() {
  std::mt19937_64 random(1);
  plist::Array entries;
  for (std::size_t i = 0; i < 10000; ++i) {
    entries.push_back(plist::Dictionary{
        {"identifier", detail::identifier(random, i)},
        {"operation", i % 20 == 0 ? "SENT" : "install"},
        {"version", std::to_string(random() % 10) + "." + std::to_string(random() % 30)},
        {"name", std::string(detail::word(random)) + " " + std::to_string(i)},
    });
  }
  return {plist::Value(std::move(entries))};
}

/// The store metadata of 2,000 apps: about 60 keys of all types, and 4 KB of data.
inline Documents makeMetadata() {
  std::mt19937_64 random(2);
  Documents documents;
  for (std::size_t i = 0; i < 2000; ++i) {
    plist::Dictionary keys;
    keys.set("softwareIdentifier", detail::identifier(random, i));
    keys.set("signature", detail::randomBytes(random, 4096));
    for (std::size_t key = 0; key < 58; ++key) {
      keys.set("metadataKeyNumber" + std::to_string(key), detail::metadataValue(random, 0));
    }
    documents.emplace_back(std::move(keys));
  }
  return documents;
}

/// Restore information of 500 apps, each with 2 KB, 1 KB and 20 KB of data.
inline Documents makeRestore() {
  std::mt19937_64 random(3);
  plist::Dictionary apps;
  for (std::size_t i = 0; i < 500; ++i) {
    apps.set(detail::identifier(random, i), plist::Dictionary{
                                                {"metadata", detail::randomBytes(random, 2048)},
                                                {"licence", detail::randomBytes(random, 1024)},
                                                {"icon", detail::randomBytes(random, 20480)},
                                            });
  }
  return {plist::Value(std::move(apps))};
}

/// The documents as files: "FOLDER/NAME/xml/0.plist" and so on, for peers that are to be measured with the same.
inline void exportDocuments(const std::filesystem::path& folder, std::string_view form,
                            const std::vector<Bytes>& files) {
  std::filesystem::create_directories(folder / form);
  for (std::size_t i = 0; i < files.size(); ++i) {
    std::ofstream file(folder / form / (std::to_string(i) + ".plist"), std::ios::binary);
    file.write(reinterpret_cast<const char*>(files[i].data()), static_cast<std::streamsize>(files[i].size()));
  }
}

}  // namespace appsync::bench
