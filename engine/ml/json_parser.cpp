// The flow-file grammar. It is strict about white space: it may stand only after an opening
// bracket, around a separator comma and around a member's colon. Each rule reports to the
// Composer through its semantic actions; actions fire only for matched parts, and a part
// that fires and then fails always fails the whole document.
#include <boost/range/iterator_range.hpp>
#include <boost/spirit/include/qi.hpp>
#include <stdexcept>

#include "engine/ml/json_value.h"

namespace ml {
namespace {

namespace qi = boost::spirit::qi;
using Iterator = std::string::const_iterator;

class FlowGrammar : public qi::grammar<Iterator> {
 public:
  explicit FlowGrammar(Composer& composer) : FlowGrammar::base_type(document_), c_(composer) {
    ws_ = *qi::char_(" \t\n\v\f\r");
    separator_ = ws_ >> ',' >> ws_;

    document_ = (object_ | array_) >> qi::eoi;
    object_ = qi::lit('{')[([this] { c_.ObjectStart(); })] >> ws_ >> *memberList_ >>
              qi::lit('}')[([this] { c_.ContainerEnd(); })];
    array_ = qi::lit('[')[([this] { c_.ArrayStart(); })] >> ws_ >> *valueList_ >>
             qi::lit(']')[([this] { c_.ContainerEnd(); })];
    memberList_ = member_ >> *(separator_ >> member_);
    valueList_ = value_ >> *(separator_ >> value_);
    member_ = string_ >> ws_ >> ':' >> ws_ >> value_;
    value_ = object_ | array_ | string_ | number_ | qi::lit("null")[([this] { c_.Null(); })] |
             qi::lit("false")[([this] { c_.Bool(false); })] |
             qi::lit("true")[([this] { c_.Bool(true); })];

    string_ = qi::lit('"')[([this] { c_.StringStart(); })] >> *item_ >>
              qi::lit('"')[([this] { c_.StringEnd(); })];
    // \x with hex digits is one byte: the low 8 bits of the value of all the digits.
    item_ =
        (qi::lit('\\') >> qi::lit('x') >>
         qi::raw[+qi::char_("0-9a-fA-F")]
                [([this](const boost::iterator_range<Iterator>& digits) { HexEscape(digits); })]) |
        (qi::lit('\\') >> qi::char_)[([this](char c) { c_.StringEscaped(c); })] |
        (~qi::char_('"'))[([this](char c) { c_.StringChar(c); })];

    // A whole number that fits 32 bits is an integer; everything else the standard real
    // reader accepts (fractions, exponents, "5.", ".5", inf, nan) is a double.
    number_ = (qi::int_ >> !qi::char_(".eE"))[([this](int v) { c_.Integer(v); })] |
              qi::double_[([this](double v) { c_.Double(v); })];
  }

 private:
  void HexEscape(const boost::iterator_range<Iterator>& digits) {
    unsigned value = 0;
    for (char d : digits) {
      const unsigned nibble = d <= '9' ? d - '0' : (d | 0x20) - 'a' + 10;
      value = ((value << 4) | nibble) & 0xFF;
    }
    c_.StringChar(static_cast<char>(value));
  }

  Composer& c_;
  qi::rule<Iterator> document_, object_, array_, memberList_, valueList_, member_, value_, string_,
      item_, number_, ws_, separator_;
};

}  // namespace

JsonValue ParseJson(const std::string& text) {
  Composer composer;
  FlowGrammar grammar(composer);
  Iterator first = text.begin();
  bool matched = false;
  try {
    matched = qi::parse(first, text.end(), grammar);
  } catch (const Composer::Rejected&) {
    matched = false;
  }
  if (!matched || first != text.end()) throw std::runtime_error("JSON: parsing error " + text);
  return composer.TakeRoot();
}

}  // namespace ml
