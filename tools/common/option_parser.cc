#include "tools/common/option_parser.h"

#include <algorithm>
#include <cerrno>
#include <cfloat>
#include <cmath>
#include <cstdlib>
#include <sstream>

namespace vesk_tool {
namespace {

// Edit distance with adjacent transpositions ("dtfm" is one step from "dtmf").
int EditDistance(const std::string& a, const std::string& b) {
  const size_t n = a.size(), m = b.size();
  std::vector<std::vector<int>> d(n + 1, std::vector<int>(m + 1));
  for (size_t i = 0; i <= n; ++i) d[i][0] = static_cast<int>(i);
  for (size_t j = 0; j <= m; ++j) d[0][j] = static_cast<int>(j);
  for (size_t i = 1; i <= n; ++i) {
    for (size_t j = 1; j <= m; ++j) {
      const int cost = a[i - 1] == b[j - 1] ? 0 : 1;
      d[i][j] = std::min({d[i - 1][j] + 1, d[i][j - 1] + 1, d[i - 1][j - 1] + cost});
      if (i > 1 && j > 1 && a[i - 1] == b[j - 2] && a[i - 2] == b[j - 1]) {
        d[i][j] = std::min(d[i][j], d[i - 2][j - 2] + 1);
      }
    }
  }
  return d[n][m];
}

// A range bound as the option's type writes it (1048576, not 1.04858e+06).
std::string FormatBound(OptionParser::Type type, double value) {
  if (type == OptionParser::Type::kInt) return std::to_string(static_cast<long long>(value));
  return FormatNumber(value);
}

// `text` in lines of at most `width` characters (longer words stand alone),
// each after the first indented by `indent` spaces.
std::string Wrap(const std::string& text, size_t width, size_t indent) {
  std::istringstream words(text);
  std::string word, wrapped, line;
  while (words >> word) {
    if (!line.empty() && line.size() + 1 + word.size() > width) {
      wrapped += line + "\n" + std::string(indent, ' ');
      line.clear();
    }
    line += (line.empty() ? "" : " ") + word;
  }
  return wrapped + line;
}

std::string JoinChoices(const std::vector<std::string>& choices) {
  std::string text;
  for (size_t i = 0; i < choices.size(); ++i) text += (i ? ", " : "") + choices[i];
  return text;
}

}  // namespace

std::string FormatNumber(double value) {
  std::ostringstream text;
  text << value;
  return text.str();
}

OptionParser::Option& OptionParser::Option::Range(double min_value, double max_value) {
  has_range = true;
  min = min_value;
  max = max_value;
  return *this;
}

OptionParser::Option& OptionParser::Option::Choices(std::vector<std::string> values) {
  choices = std::move(values);
  return *this;
}

OptionParser::Option& OptionParser::Option::Placeholder(std::string text) {
  placeholder = std::move(text);
  return *this;
}

OptionParser::Option& OptionParser::Add(const std::string& name, Type type, void* value,
                                        const std::string& help) {
  options_.emplace_back();
  Option& option = options_.back();
  option.name = name;
  option.type = type;
  option.value = value;
  option.help = help;
  switch (type) {
    case Type::kInt:
      option.default_text = std::to_string(*static_cast<int*>(value));
      break;
    case Type::kFloat:
      option.default_text = FormatNumber(*static_cast<float*>(value));
      break;
    case Type::kDouble:
      option.default_text = FormatNumber(*static_cast<double*>(value));
      break;
    case Type::kString:
      option.default_text = *static_cast<std::string*>(value);
      break;
    case Type::kFlag:
      option.default_text = *static_cast<bool*>(value) ? "on" : "off";
      break;
    case Type::kList: {
      const std::vector<double>& list = *static_cast<std::vector<double>*>(value);
      for (size_t i = 0; i < list.size(); ++i) {
        option.default_text += (i ? "," : "") + FormatNumber(list[i]);
      }
      if (list.empty()) option.default_text = "none";
      break;
    }
    case Type::kChoice:
      break;
  }
  return option;
}

OptionParser::Option& OptionParser::AddInt(const std::string& name, int* value,
                                           const std::string& help) {
  return Add(name, Type::kInt, value, help);
}

OptionParser::Option& OptionParser::AddFloat(const std::string& name, float* value,
                                             const std::string& help) {
  return Add(name, Type::kFloat, value, help);
}

OptionParser::Option& OptionParser::AddDouble(const std::string& name, double* value,
                                              const std::string& help) {
  return Add(name, Type::kDouble, value, help);
}

OptionParser::Option& OptionParser::AddString(const std::string& name, std::string* value,
                                              const std::string& help) {
  return Add(name, Type::kString, value, help);
}

OptionParser::Option& OptionParser::AddFlag(const std::string& name, bool* value,
                                            const std::string& help) {
  return Add(name, Type::kFlag, value, help);
}

OptionParser::Option& OptionParser::AddList(const std::string& name, std::vector<double>* value,
                                            const std::string& help) {
  return Add(name, Type::kList, value, help);
}

OptionParser::Option* OptionParser::Find(const std::string& name) {
  for (Option& option : options_) {
    if (option.name == name) return &option;
  }
  return nullptr;
}

bool OptionParser::ParseNumber(const Option& option, const std::string& text, double* number,
                               std::string* error) {
  const std::string shown = "--" + option.name + " " + text;
  if (option.type == Type::kInt) {
    char* end = nullptr;
    errno = 0;
    const long long v = std::strtoll(text.c_str(), &end, 10);
    if (text.empty() || *end != '\0' || errno != 0 || v < INT32_MIN || v > INT32_MAX) {
      *error = "--" + option.name + " needs a whole number, not '" + text + "'";
      return false;
    }
    *number = static_cast<double>(v);
  } else {
    char* end = nullptr;
    errno = 0;
    *number = std::strtod(text.c_str(), &end);
    const bool overflow = errno == ERANGE && std::fabs(*number) > 1.0;
    const double limit = option.type == Type::kFloat ? FLT_MAX : DBL_MAX;
    if (text.empty() || *end != '\0' || std::isnan(*number) || overflow ||
        (std::isfinite(*number) && std::fabs(*number) > limit)) {
      *error = "--" + option.name + " needs a number, not '" + text + "'";
      return false;
    }
  }
  if (!option.has_range && !std::isfinite(*number)) {
    *error = "--" + option.name + " needs a finite number, not '" + text + "'";
    return false;
  }
  if (option.has_range && !(*number >= option.min && *number <= option.max)) {
    *error = shown + ": out of range (" + FormatBound(option.type, option.min) + " to " +
             FormatBound(option.type, option.max) + ")";
    return false;
  }
  return true;
}

bool OptionParser::Assign(const Option& option, const std::string& text, std::string* error) {
  const auto choice = std::find(option.choices.begin(), option.choices.end(), text);
  if (!option.choices.empty() && choice == option.choices.end()) {
    *error = "--" + option.name + " " + text + ": must be one of " + JoinChoices(option.choices);
    return false;
  }
  double number = 0.0;
  switch (option.type) {
    case Type::kInt:
      if (!ParseNumber(option, text, &number, error)) return false;
      *static_cast<int*>(option.value) = static_cast<int>(number);
      break;
    case Type::kFloat:
      if (!ParseNumber(option, text, &number, error)) return false;
      *static_cast<float*>(option.value) = static_cast<float>(number);
      break;
    case Type::kDouble:
      if (!ParseNumber(option, text, &number, error)) return false;
      *static_cast<double*>(option.value) = number;
      break;
    case Type::kString:
      *static_cast<std::string*>(option.value) = text;
      break;
    case Type::kList: {
      std::vector<double> list;
      std::stringstream items(text);
      std::string item;
      while (!text.empty() && std::getline(items, item, ',')) {
        if (!ParseNumber(option, item, &number, error)) return false;
        list.push_back(number);
      }
      if (!text.empty() && text.back() == ',') {
        *error = "--" + option.name + " needs a number after every comma, not '" + text + "'";
        return false;
      }
      *static_cast<std::vector<double>*>(option.value) = list;
      break;
    }
    case Type::kChoice:
      option.select(static_cast<size_t>(choice - option.choices.begin()));
      break;
    case Type::kFlag:
      break;
  }
  return true;
}

bool OptionParser::Given(const std::string& name) const {
  return std::find(given_.begin(), given_.end(), name) != given_.end();
}

std::string OptionParser::Nearest(const std::string& name) const {
  std::string prefix_match;
  int prefix_matches = 0;
  std::string nearest;
  int best = name.size() >= 5 ? 2 : 1;  // Farther than this is no suggestion.
  for (const Option& option : options_) {
    if (!name.empty() && option.name.rfind(name, 0) == 0) {
      prefix_match = option.name;
      ++prefix_matches;
    }
    const int distance = EditDistance(name, option.name);
    if (distance <= best && (distance < best || nearest.empty())) {
      best = distance;
      nearest = option.name;
    }
  }
  if (prefix_matches == 1) return prefix_match;
  return nearest;
}

bool OptionParser::Parse(const std::vector<std::string>& args, std::string* error) {
  positional_.clear();
  given_.clear();
  help_requested_ = false;
  for (size_t i = 0; i < args.size(); ++i) {
    const std::string& arg = args[i];
    if (arg == "-h" || arg == "--help") {
      help_requested_ = true;
      return true;
    }
    if (arg == "--") {
      positional_.insert(positional_.end(), args.begin() + i + 1, args.end());
      return true;
    }
    if (arg == "-" || arg.empty() || arg[0] != '-') {
      positional_.push_back(arg);
      continue;
    }
    const bool long_form = arg.rfind("--", 0) == 0;
    std::string name = arg.substr(long_form ? 2 : 1);
    std::string value;
    bool has_value = false;
    const size_t equals = name.find('=');
    if (equals != std::string::npos) {
      value = name.substr(equals + 1);
      name = name.substr(0, equals);
      has_value = true;
    }
    Option* option = long_form ? Find(name) : nullptr;
    if (option == nullptr && long_form && name.rfind("no-", 0) == 0) {
      Option* flag = Find(name.substr(3));
      if (flag != nullptr && flag->type == Type::kFlag) {
        if (has_value) {
          *error = "--" + name + " takes no value";
          return false;
        }
        *static_cast<bool*>(flag->value) = false;
        given_.push_back(flag->name);
        continue;
      }
    }
    if (option == nullptr) {
      *error = "unknown option " + std::string(long_form ? "--" : "-") + name;
      const std::string nearest = Nearest(name);
      *error += nearest.empty() ? " (see --help)" : " (did you mean --" + nearest + "?)";
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
  // Columns of the help: the option, then its text, within the line width.
  constexpr size_t kNameWidth = 30;
  constexpr size_t kLineWidth = 100;
  std::ostringstream out;
  for (const Option& option : options_) {
    std::string name = "--" + option.name;
    std::string placeholder = option.placeholder;
    if (placeholder.empty()) {
      placeholder = option.type == Type::kInt      ? "N"
                    : option.type == Type::kString ? "TEXT"
                    : option.type == Type::kList   ? "X,..."
                    : option.type == Type::kChoice ? "NAME"
                                                   : "X";
    }
    if (option.type == Type::kFlag) {
      name = "--[no-]" + option.name;
    } else {
      name += " " + placeholder;
    }
    std::string details;
    if (!option.choices.empty()) {
      details = "one of " + JoinChoices(option.choices);
    } else if (option.has_range) {
      details =
          FormatBound(option.type, option.min) + " to " + FormatBound(option.type, option.max);
    }
    if (!option.default_text.empty()) {
      details += (details.empty() ? "" : "; ") + std::string("default ") + option.default_text;
    }
    const std::string text = option.help + (details.empty() ? "" : " (" + details + ")");
    out << "  " << name << std::string(name.size() < kNameWidth ? kNameWidth - name.size() : 1, ' ')
        << Wrap(text, kLineWidth - kNameWidth - 2, kNameWidth + 2) << "\n";
  }
  return out.str();
}

}  // namespace vesk_tool
