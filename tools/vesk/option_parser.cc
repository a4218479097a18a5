#include "tools/vesk/option_parser.h"

#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <sstream>

namespace vesk_tool {

void OptionParser::AddInt(const std::string& name, int* value, const std::string& help) {
  options_.push_back({name, Type::kInt, value, help});
}

void OptionParser::AddFloat(const std::string& name, float* value, const std::string& help) {
  options_.push_back({name, Type::kFloat, value, help});
}

void OptionParser::AddString(const std::string& name, std::string* value, const std::string& help) {
  options_.push_back({name, Type::kString, value, help});
}

void OptionParser::AddFlag(const std::string& name, bool* value, const std::string& help) {
  options_.push_back({name, Type::kFlag, value, help});
}

const OptionParser::Option* OptionParser::Find(const std::string& name) const {
  for (const Option& option : options_) {
    if (option.name == name) return &option;
  }
  return nullptr;
}

bool OptionParser::Assign(const Option& option, const std::string& text, std::string* error) {
  const char* begin = text.c_str();
  char* end = nullptr;
  errno = 0;
  switch (option.type) {
    case Type::kInt: {
      const long v = std::strtol(begin, &end, 10);
      if (text.empty() || *end != '\0' || errno != 0 || v < -2147483647L || v > 2147483647L) {
        *error = "--" + option.name + " needs a whole number, not '" + text + "'";
        return false;
      }
      *static_cast<int*>(option.value) = static_cast<int>(v);
      return true;
    }
    case Type::kFloat: {
      const float v = std::strtof(begin, &end);
      if (text.empty() || *end != '\0' || errno != 0 || !std::isfinite(v)) {
        *error = "--" + option.name + " needs a number, not '" + text + "'";
        return false;
      }
      *static_cast<float*>(option.value) = v;
      return true;
    }
    case Type::kString:
      *static_cast<std::string*>(option.value) = text;
      return true;
    case Type::kFlag:
      break;
  }
  *error = "--" + option.name + " takes no value";
  return false;
}

bool OptionParser::Given(const std::string& name) const {
  for (const std::string& given : given_) {
    if (given == name) return true;
  }
  return false;
}

bool OptionParser::Parse(const std::vector<std::string>& args, std::string* error) {
  positional_.clear();
  given_.clear();
  for (size_t i = 0; i < args.size(); ++i) {
    const std::string& arg = args[i];
    if (arg.rfind("--", 0) != 0 || arg == "--") {
      positional_.push_back(arg);
      continue;
    }
    std::string name = arg.substr(2);
    std::string value;
    bool has_value = false;
    const size_t equals = name.find('=');
    if (equals != std::string::npos) {
      value = name.substr(equals + 1);
      name = name.substr(0, equals);
      has_value = true;
    }
    const Option* option = Find(name);
    if (option == nullptr && name.rfind("no-", 0) == 0 && !has_value) {
      const Option* flag = Find(name.substr(3));
      if (flag != nullptr && flag->type == Type::kFlag) {
        *static_cast<bool*>(flag->value) = false;
        given_.push_back(flag->name);
        continue;
      }
    }
    if (option == nullptr) {
      *error = "unknown option --" + name;
      return false;
    }
    if (option->type == Type::kFlag) {
      if (has_value) {
        *error = "--" + name + " takes no value (use --no-" + name + " to turn it off)";
        return false;
      }
      *static_cast<bool*>(option->value) = true;
      given_.push_back(name);
      continue;
    }
    if (!has_value) {
      if (i + 1 >= args.size()) {
        *error = "--" + name + " needs a value";
        return false;
      }
      value = args[++i];
    }
    if (!Assign(*option, value, error)) return false;
    given_.push_back(name);
  }
  return true;
}

std::string OptionParser::Help() const {
  std::ostringstream out;
  for (const Option& option : options_) {
    std::string name = "--" + option.name;
    switch (option.type) {
      case Type::kInt:
        name += " N (" + std::to_string(*static_cast<int*>(option.value)) + ")";
        break;
      case Type::kFloat: {
        std::ostringstream v;
        v << *static_cast<float*>(option.value);
        name += " X (" + v.str() + ")";
        break;
      }
      case Type::kString: {
        const std::string& v = *static_cast<std::string*>(option.value);
        name += " S" + (v.empty() ? std::string() : " (" + v + ")");
        break;
      }
      case Type::kFlag:
        name = "--[no-]" + option.name + (*static_cast<bool*>(option.value) ? " (on)" : " (off)");
        break;
    }
    out << "  " << name;
    out << std::string(name.size() < 34 ? 34 - name.size() : 1, ' ') << option.help << "\n";
  }
  return out.str();
}

bool ParseHexBytes(const std::string& text, std::vector<unsigned char>* bytes) {
  std::string digits;
  size_t start = (text.rfind("0x", 0) == 0 || text.rfind("0X", 0) == 0) ? 2 : 0;
  for (size_t i = start; i < text.size(); ++i) {
    const char c = text[i];
    if (c == ' ' || c == ':' || c == '-') continue;
    if (!std::isxdigit(static_cast<unsigned char>(c))) return false;
    digits += c;
  }
  if (digits.size() % 2 != 0) return false;
  bytes->clear();
  for (size_t i = 0; i < digits.size(); i += 2) {
    bytes->push_back(static_cast<unsigned char>(std::stoi(digits.substr(i, 2), nullptr, 16)));
  }
  return true;
}

std::string ToHex(const std::vector<unsigned char>& bytes) {
  static const char kDigits[] = "0123456789abcdef";
  std::string text;
  for (unsigned char b : bytes) {
    text += kDigits[b >> 4];
    text += kDigits[b & 15];
  }
  return text;
}

}  // namespace vesk_tool
