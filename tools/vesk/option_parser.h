// A small command-line option parser for the vesk tool.
//
//   OptionParser parser;
//   parser.AddInt("repeat", &repeat, "token repetitions");
//   parser.AddFlag("crc", &crc, "append CRC-16 bytes");   // --crc / --no-crc
//   if (!parser.Parse(args, &error)) ...
//
// Options are "--name value" or "--name=value"; flags are "--name" and
// "--no-name". Values are checked to be whole numbers or numbers as declared;
// an unknown option, a missing value and a malformed number are errors.

#ifndef TOOLS_VESK_OPTION_PARSER_H_
#define TOOLS_VESK_OPTION_PARSER_H_

#include <string>
#include <vector>

namespace vesk_tool {

class OptionParser {
 public:
  void AddInt(const std::string& name, int* value, const std::string& help);
  void AddFloat(const std::string& name, float* value, const std::string& help);
  void AddString(const std::string& name, std::string* value, const std::string& help);
  void AddFlag(const std::string& name, bool* value, const std::string& help);

  // Parses `args` into the registered variables, which keep their values
  // (the defaults) unless given. Arguments that do not start with "--" are
  // collected in positional(). Returns false with a message on error.
  bool Parse(const std::vector<std::string>& args, std::string* error);

  const std::vector<std::string>& positional() const { return positional_; }

  // Whether the last Parse() set option `name` (in either flag form).
  bool Given(const std::string& name) const;

  // One line per option: name, current (default) value, help.
  std::string Help() const;

 private:
  enum class Type { kInt, kFloat, kString, kFlag };
  struct Option {
    std::string name;
    Type type;
    void* value;
    std::string help;
  };
  const Option* Find(const std::string& name) const;
  static bool Assign(const Option& option, const std::string& text, std::string* error);

  std::vector<Option> options_;
  std::vector<std::string> positional_;
  std::vector<std::string> given_;
};

// Parses hexadecimal text ("0a1B2c", optionally with "0x" and spaces or
// colons between bytes) into bytes. False for odd digit counts or non-hex.
bool ParseHexBytes(const std::string& text, std::vector<unsigned char>* bytes);

std::string ToHex(const std::vector<unsigned char>& bytes);

}  // namespace vesk_tool

#endif  // TOOLS_VESK_OPTION_PARSER_H_
