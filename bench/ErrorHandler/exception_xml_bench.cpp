// The XML exchange of exceptions: writing and re-reading a three-deep cause chain, against RapidXml
// used directly in its 16-bit form on the same text (the parse and print alone, with none of the
// conversions at the edges or the exception objects). The difference is what the UTF-8 form and
// the conversions cost.
#include <benchmark/benchmark.h>

#include <rapidxml.hpp>
#include <rapidxml_print.hpp>

#include <iterator>
#include <string>

#include "owutils/Exceptions.h"
#include "owutils/RemoteException.h"

namespace {

Lumo::String SampleXml() {
  try {
    try {
      try {
        THROW_AT(LumoException::UnexpectedValue(Lumo::String(u"\u4e2d\u6587 \u0437\u043d\u0430\u0447\u0435\u043d\u0438\u0435"), 7));
      } catch (LumoException::Exception& e) {
        THROW_AT(LumoStringUnableToDecodeStringFromURI(Lumo::String(u"%41 Latvie\u0161u valoda"), e));
      }
    } catch (LumoException::Exception& e) {
      THROW_AT(LumoException::AssertionFailed1(Lumo::String(u"status == 0"), 1, e));
    }
  } catch (LumoException::Exception& e) {
    return LumoException::ToXml(e);
  }
  return Lumo::String();
}

void BM_ToXml(benchmark::State& state) {
  LumoException::RemoteException e(SampleXml());
  for (auto _ : state) benchmark::DoNotOptimize(LumoException::ToXml(e));
}
BENCHMARK(BM_ToXml);

void BM_RemoteException(benchmark::State& state) {
  const Lumo::String xml = SampleXml();
  for (auto _ : state) {
    LumoException::RemoteException e(xml);
    benchmark::DoNotOptimize(e.GetMessage());
  }
}
BENCHMARK(BM_RemoteException);

void BM_RapidXml16ParseAndPrint(benchmark::State& state) {
  const std::u16string xml = SampleXml();
  for (auto _ : state) {
    std::u16string copy = xml;
    rapidxml::xml_document<char16_t> doc;
    doc.parse<0>(copy.data());
    std::u16string printed;
    rapidxml::print(std::back_inserter(printed), *doc.first_node(), 0);
    benchmark::DoNotOptimize(printed);
  }
}
BENCHMARK(BM_RapidXml16ParseAndPrint);

}  // namespace
BENCHMARK_MAIN();
