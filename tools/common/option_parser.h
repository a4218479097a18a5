// The command-line option parser of the tools.
//
//   OptionParser parser;
//   parser.AddInt("repeat", &repeat, "token repetitions").Range(1, 100);
//   parser.AddFlag("crc", &crc, "append CRC-16 bytes");   // --crc / --no-crc
//   parser.AddString("preset", &preset, "coder").Choices({"48k", "44k"});
//   parser.AddList("tones", &tones, "Hz").Range(1, 24000);   // --tones 1200,18600
//   parser.AddChoice("speaker", &profile, {{"flat", kFlat}, {"budget", kBudget}}, "...");
//   if (!parser.Parse(args, &error)) ...            // error names option and value
//   if (parser.help_requested()) print parser.Help();
//
// Options are "--name value" or "--name=value"; flags are "--name" and
// "--no-name"; "-h" and "--help" ask for help; "-" is a positional argument
// (standard input or output) and "--" ends the options. Every value is checked
// as it is parsed: whole numbers, numbers, the declared range or choices. An
// unknown option is an error that names the nearest known one.
//
// Parse works on an argument vector alone (no process state), so it can be
// driven directly by tests and fuzzers. The parser keeps pointers to the
// variables it fills: they must outlive it. Not thread-safe.

#ifndef TOOLS_COMMON_OPTION_PARSER_H_
#define TOOLS_COMMON_OPTION_PARSER_H_

#include <cstddef>
#include <deque>
#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace vesk_tool {

class OptionParser {
 public:
  enum class Type { kInt, kFloat, kDouble, kString, kFlag, kList, kChoice };

  // One registered option. The setters return the option for chaining.
  class Option {
   public:
    // Numbers (and each number of a list): the value must lie in [min, max];
    // an infinite bound admits "inf" (or "-inf") as a value. Without a range
    // any finite number passes.
    Option& Range(double min, double max);
    // Strings and whole numbers: the value must be one of `choices` (as written).
    Option& Choices(std::vector<std::string> choices);
    // The word standing for the value in the help ("HZ", "HEX"); by default
    // N, X or TEXT.
    Option& Placeholder(std::string placeholder);

   private:
    friend class OptionParser;
    std::string name;
    Type type = Type::kFlag;
    void* value = nullptr;
    std::string help;
    std::string default_text;  // The value at registration, as the help shows it.
    bool has_range = false;
    double min = 0.0;
    double max = 0.0;
    std::vector<std::string> choices;
    std::string placeholder;
    std::function<void(size_t)> select;  // kChoice: stores choice i.
  };

  OptionParser() = default;
  OptionParser(const OptionParser&) = delete;
  OptionParser& operator=(const OptionParser&) = delete;

  // Registers --name. The variable's value at this call is the default that
  // the help shows; it is changed only when the option is given.
  Option& AddInt(const std::string& name, int* value, const std::string& help);
  Option& AddFloat(const std::string& name, float* value, const std::string& help);
  Option& AddDouble(const std::string& name, double* value, const std::string& help);
  Option& AddString(const std::string& name, std::string* value, const std::string& help);
  Option& AddFlag(const std::string& name, bool* value, const std::string& help);
  // Comma-separated numbers ("" for none) into *value.
  Option& AddList(const std::string& name, std::vector<double>* value, const std::string& help);
  // One of the names of `choices`; stores its value in *value. The default
  // shown is the name of *value's value at registration.
  template <typename T>
  Option& AddChoice(const std::string& name, T* value,
                    const std::vector<std::pair<std::string, T>>& choices,
                    const std::string& help) {
    std::vector<std::string> names;
    std::string current;
    for (const auto& choice : choices) {
      names.push_back(choice.first);
      if (choice.second == *value) current = choice.first;
    }
    Option& option = Add(name, Type::kChoice, nullptr, help);
    option.default_text = current;
    option.choices = names;
    option.select = [value, choices](size_t i) { *value = choices[i].second; };
    return option;
  }

  // Parses `args` into the registered variables. Arguments that are not
  // options are collected in positional(). Returns false with a one-line
  // message on the first error; after "-h" or "--help" returns true at once
  // with help_requested() set.
  bool Parse(const std::vector<std::string>& args, std::string* error);

  const std::vector<std::string>& positional() const { return positional_; }
  bool help_requested() const { return help_requested_; }

  // Whether the last Parse() set option `name` (in either flag form).
  bool Given(const std::string& name) const;

  // One line per option: name and value placeholder, help, the range or
  // choices, and the default.
  std::string Help() const;

  // The registered option nearest to `name` (a unique prefix, or within a
  // small edit distance), or an empty string.
  std::string Nearest(const std::string& name) const;

 private:
  Option& Add(const std::string& name, Type type, void* value, const std::string& help);
  Option* Find(const std::string& name);
  static bool Assign(const Option& option, const std::string& text, std::string* error);
  // A number of `option`'s type and range from `text`; false with *error.
  static bool ParseNumber(const Option& option, const std::string& text, double* number,
                          std::string* error);

  std::deque<Option> options_;  // A deque: Add() hands out references that must stay valid.
  std::vector<std::string> positional_;
  std::vector<std::string> given_;
  bool help_requested_ = false;
};

// Formats a number as the help and the error messages show it: the shortest
// of up to 6 significant digits ("18500", "0.005", "inf").
std::string FormatNumber(double value);

}  // namespace vesk_tool

#endif  // TOOLS_COMMON_OPTION_PARSER_H_
