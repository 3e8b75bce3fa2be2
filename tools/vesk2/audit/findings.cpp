// SPDX-License-Identifier: Apache-2.0
// findings.cpp: what is wrong with the stores.
#include "tools/vesk2/audit/findings.h"

#include <algorithm>

#include "tools/vesk2/objects/shapes.h"

namespace vesk2_command {

Findings::Findings(Ref<TimeStamp> now, Ref<TimeStamp> soon)
    : now_(std::move(now)), soon_(std::move(soon)) {}

StoreFinding& Findings::Add(const std::string& word, const std::string& path,
                            const std::string& text) {
  return found_.emplace_back(StoreFinding{word, path, text});
}

bool Findings::AddEnd(const std::string& path, const std::string& what, const TimeStamp* end,
                      size_t certificate) {
  if (end == nullptr || !end->IsBefore(soon_.get())) return false;
  const bool ended = end->IsBefore(now_.get());
  const std::string stamp = StampText(*end);
  StoreFinding& finding = ended ? Add("ended", path, what + " ended at " + stamp)
                                : Add("ending", path, what + " ends at " + stamp);
  finding.certificate = certificate;
  finding.when = Ref<TimeStamp>::Share(const_cast<TimeStamp*>(end));
  return ended;
}

bool Findings::Read(const std::string& path, const std::function<void()>& read) {
  try {
    read();
    return true;
  } catch (const Trouble& trouble) {
    if (trouble.code == VESK2_ERR_MEM_ALLOC) throw;
    std::string text = trouble.what();
    const std::string lead = Escape(path) + ": ";
    if (text.starts_with(lead)) text.erase(0, lead.size());
    if (trouble.reason == "io") {
      Add("unreadable", path, text);
    } else {
      Add("malformed", path, text);
    }
    return false;
  }
}

void Findings::ReadDirectory(const std::function<void()>& read) {
  try {
    read();
  } catch (const Trouble& trouble) {
    if (!trouble_) trouble_ = trouble;
  }
}

void Findings::Tell() {
  std::ranges::stable_sort(found_, {}, &StoreFinding::path);
  Json& list = Result()["findings"] = Json::array();
  for (const StoreFinding& each : found_) {
    Say(each.word + "  " + Escape(each.path) + ": " + each.text);
    list.push_back({{"finding", each.word},
                    {"file", Escape(each.path)},
                    {"certificate", each.certificate != 0 ? Json(each.certificate) : Json()},
                    {"when", StampJson(each.when.get())},
                    {"text", each.text}});
  }
  if (trouble_) throw Trouble(*trouble_);
}

}  // namespace vesk2_command
