// SPDX-License-Identifier: Apache-2.0
// token_key.cpp: signing by libcrypto's PKCS#11 engine. Debian 12 has no provider for tokens;
// engines are deprecated, and nothing else of the command uses them.
#define OPENSSL_SUPPRESS_DEPRECATED
#include "tools/vesk2/keys/token_key.h"

#include <dlfcn.h>
#include <openssl/engine.h>
#include <openssl/err.h>
#include <openssl/ui.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <map>

#include "tools/vesk2/keys/token_uri.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

constexpr const char* kReason = "token";

struct FinishEngine {
  void operator()(ENGINE* engine) const {
    ENGINE_finish(engine);
    ENGINE_free(engine);
  }
};
using Engine = std::unique_ptr<ENGINE, FinishEngine>;

bool Set(ENGINE* engine, const char* name, const char* value) {
  return ENGINE_ctrl_cmd_string(engine, name, value, 0) == 1;
}

// libcrypto's own way to load engines knows each only once. Null if it is not on this machine.
dynamic_bind_engine FindEngine() {
  const char* directory = secure_getenv("OPENSSL_ENGINES");  // as libcrypto asks
  if (directory == nullptr) directory = OPENSSL_info(OPENSSL_INFO_ENGINES_DIR);
  const std::string path = std::string(directory != nullptr ? directory : "") + "/pkcs11.so";
  void* const library = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL | RTLD_NODELETE);
  void* const found = library != nullptr ? dlsym(library, "bind_engine") : nullptr;
  return reinterpret_cast<dynamic_bind_engine>(found);
}

// An engine of its own for each token: one would try the PIN of the first on all others.
Engine LoadEngine(const TokenUri& uri) {
  const dynamic_bind_engine bind = FindEngine();
  const std::unique_ptr<ENGINE, decltype(&ENGINE_free)> engine(ENGINE_new(), &ENGINE_free);
  if (!engine) throw std::bad_alloc();
  dynamic_fns functions = {};
  functions.static_state = ENGINE_get_static_state();  // it shares this libcrypto
  if (bind == nullptr || bind(engine.get(), "pkcs11", &functions) == 0) {
    throw Trouble("keys of tokens need the package libengine-pkcs11-openssl, which is not here",
                  kReason);
  }
  if (!uri.modulePath.empty() && access(uri.modulePath.c_str(), R_OK) != 0) {
    throw Trouble(Escape(uri.modulePath) + ": " + std::strerror(errno), kReason);
  }
  (void)Set(engine.get(), "QUIET", nullptr);  // what it would print is told below
  const bool chosen =
      uri.modulePath.empty() || Set(engine.get(), "MODULE_PATH", uri.modulePath.c_str());
  if (!chosen || ENGINE_init(engine.get()) != 1) {
    throw Trouble("the engine for tokens: " + CryptoReason(), kReason);
  }
  ENGINE_up_ref(engine.get());
  return Engine(engine.get());
}

}  // namespace

// The engines that are loaded. They go together, with the last key: to finish one closes the
// sessions of all that use the same module. And they go before the program ends, when modules are
// taken down in an order of their own.
class TokenEngines {
 public:
  static std::shared_ptr<TokenEngines> Get() {
    static std::weak_ptr<TokenEngines> kept;
    std::shared_ptr<TokenEngines> engines = kept.lock();
    if (!engines) kept = engines = std::make_shared<TokenEngines>();
    return engines;
  }

  ENGINE* Of(const TokenUri& uri) {
    Engine& engine = engines_[uri.modulePath + "?" + uri.token];
    if (!engine) engine = LoadEngine(uri);
    return engine.get();
  }

 private:
  std::map<std::string, Engine> engines_;
};

namespace {

// Why no key came of it. The engine tells the answers of the module by their numbers.
Trouble WhyNot(const std::string& shown, const Asking& asking, bool isPrivate) {
  constexpr int kWrongPin[] = {0xa0, 0xa1, 0xa2};  // incorrect, invalid, of a wrong length
  const unsigned long error = ERR_peek_error();
  const char* const room = ERR_lib_error_string(error);
  const bool ofModule = room != nullptr && std::strcmp(room, "PKCS#11 module") == 0;
  const int number = ERR_GET_REASON(error);
  const std::string text = CryptoReason();
  if (asking.failed) {
    return Trouble(shown + (isPrivate ? ": no PIN was given (pin-source, --passphrase-file, "
                                        "--passphrase-fd)"
                                      : ": no such key on any token, or not without the PIN"),
                   isPrivate ? "passphrase" : kReason);
  }
  for (const int each : kWrongPin) {
    if (ofModule && number == each) return Trouble(shown + ": wrong PIN", "wrong-passphrase");
  }
  if (text == "object not found") return Trouble(shown + ": no such key on any token", kReason);
  return Trouble(shown + ": " + text, kReason);
}

CryptoKey Load(TokenEngines& engines, const std::string& name, const PassphraseOptions& options,
               bool isPrivate) {
  const TokenUri uri = ParseTokenUri(name);
  ENGINE* const engine = engines.Of(uri);
  const std::unique_ptr<UI_METHOD, decltype(&UI_destroy_method)> method(
      UI_UTIL_wrap_read_pem_callback(&GivePassphrase, 0), &UI_destroy_method);
  if (!method) throw std::bad_alloc();
  const std::string shown = ShownTokenUri(name);
  Asking asking{uri.pin.Named() ? uri.pin : options, shown, "PIN"};
  ERR_clear_error();
  const auto load = isPrivate ? &ENGINE_load_private_key : &ENGINE_load_public_key;
  CryptoKey key = OwnKey(load(engine, uri.path.c_str(), method.get(), &asking));
  if (asking.problem) std::rethrow_exception(asking.problem);
  if (!key) throw WhyNot(Escape(shown), asking, isPrivate);
  return key;
}

}  // namespace

TokenKey::TokenKey(const std::string& uri, const PassphraseOptions& options)
    : SigningKey(ShownTokenUri(uri), kReason),
      engines_(TokenEngines::Get()),
      key_(Load(*engines_, uri, options, true)) {}

Ref<PublicKey> TokenKey::Public() const { return MakePublicKey(key_.get(), source_); }

std::string TokenKey::SignObject(SExpression& /*object*/, std::string_view digest,
                                 const std::string& algorithm) const {
  return SignDigest(key_.get(), digest, algorithm);
}

Ref<PublicKey> ReadTokenPublic(const std::string& uri, const PassphraseOptions& options) {
  const std::shared_ptr<TokenEngines> engines = TokenEngines::Get();
  return MakePublicKey(Load(*engines, uri, options, false).get(), ShownTokenUri(uri));
}

}  // namespace vesk2_command
