// SPDX-License-Identifier: Apache-2.0
// key_name.cpp: vesk2 key name.
#include <algorithm>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/stores/key_names.h"

namespace vesk2_command {
namespace {

struct Options {
  std::string key;
  std::string name;
  std::string remove;
  bool force = false;
  PassphraseOptions passphrase;
};

void Tell(const std::string& fingerprint, const std::string& name) {
  Say(fingerprint + "  " + name);
  Result()["names"].push_back({{"fingerprint", fingerprint}, {"name", name}});
}

ExitCode List() {
  const KeyNames names = ReadNames();
  Result()["names"] = Json::array();
  for (const auto& [fingerprint, name] : names) Tell(fingerprint, name);
  if (names.empty()) Note("no key has a name");
  return kYes;
}

auto FindName(KeyNames& names, const std::string& name) {
  return std::ranges::find_if(names, [&](const auto& each) { return each.second == name; });
}

ExitCode Remove(const std::string& name) {
  bool found = false;
  if (KeyNames names = ReadNames(); FindName(names, name) != names.end()) {
    ChangeNames([&](KeyNames& all) {
      const auto each = FindName(all, name);
      found = each != all.end();
      if (found) all.erase(each);
    });
  }
  return found ? kYes : No("nothing", "no key is called " + Escape(name));
}

// Another key's name is never taken away from it in passing: whoever reads it would be misled.
void Name(KeyNames& names, const std::string& fingerprint, const Options& options) {
  const auto other = FindName(names, options.name);
  if (other != names.end() && other->first != fingerprint) {
    throw Trouble(
        Escape(options.name) + " is the name of " + other->first + "; --remove takes it away first",
        "exists");
  }
  std::string& name = names[fingerprint];
  if (!name.empty() && name != options.name && !options.force) {
    throw Trouble(fingerprint + " has this name already; --force gives it another", "exists");
  }
  name = options.name;
}

ExitCode Give(const Options& options) {
  const std::string why = WhyNoName(options.name);
  if (!why.empty()) throw Trouble("the name \"" + Escape(options.name) + "\": " + why, "usage");
  const std::string fingerprint =
      IsFingerprint(options.key)
          ? options.key
          : Fingerprint(*ReadPublicHalf(options.key, options.passphrase).key);
  ChangeNames([&](KeyNames& names) { Name(names, fingerprint, options); });
  Tell(fingerprint, options.name);
  return kYes;
}

ExitCode Run(const Options& options) {
  UseNames({});  // what is told of names here is not told twice
  if (!options.remove.empty() && options.key.empty()) return Remove(options.remove);
  if (options.key.empty()) return List();
  if (options.name.empty() || !options.remove.empty()) {
    throw Trouble("KEY NAME gives a name, --remove NAME takes it away", "usage");
  }
  return Give(options);
}

}  // namespace

Action DefineKeyName(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("key", options->key, "A key, as key show takes it, or its fingerprint");
  list.Add("name", options->name, "What it is to be called here");
  list.Add("--remove", options->remove, "Take this name away");
  list.Add("-f,--force", options->force, "Give a key that has a name another one");
  AddPassphraseOptions(list, options->passphrase);
  list.Footer(
      "Without KEY all names are listed. A name is yours alone, in the file \"names\" of the home "
      "store;\nevery answer shows it beside the fingerprint, and nothing is decided by it.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
