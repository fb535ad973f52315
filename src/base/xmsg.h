// xmsg: the library's own exception, carrying one failure text. It is thrown and caught
// inside engine loading, whose catcher takes the text as the reason of the failure; it never
// crosses an exported function or an engine call.
#pragma once

#include <exception>
#include <string>
#include <utility>

namespace vox {

class xmsg : public std::exception {
 public:
  explicit xmsg(std::string text) : text_(std::move(text)) {}
  const char* what() const noexcept override { return text_.c_str(); }
  const std::string& text() const noexcept { return text_; }

 private:
  std::string text_;
};

}  // namespace vox
