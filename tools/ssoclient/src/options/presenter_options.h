#ifndef SSOCLIENT_TOOL_OPTIONS_PRESENTER_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_PRESENTER_OPTIONS_H

#include <string>

#include <ssoclient/access/presenter.h>

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// What is known of the one who has sent a token: nothing, a TLS certificate or a signature.
class PresenterOptions {
 public:
  void AddTo(CLI::App& command);
  /// Throws `ToolException` of the kind "proof-file" when a file cannot be read.
  Access::Presenter MakePresenter() const;

 private:
  std::string certificatePath_;
  std::string dataPath_;
  std::string signaturePath_;
  std::string algorithm_ = "rsa-sha256";
};

}  // namespace SsoClient::Tool

#endif
