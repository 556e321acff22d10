#include <corvexa/corvexa.hpp>
#include <iostream>

int main() try {
  corvexa::Replica inv = corvexa::Replica::read_xml_file("inventory.xml");   // schema + data
  for (const corvexa::ClassDef& c : inv.classes()) {
    std::cout << c.name() << ":";
    for (const corvexa::AttributeDef& a : c.attributes()) std::cout << ' ' << a.name();
    std::cout << '\n';
  }
  corvexa::Model parts = inv.model("Part");
  for (corvexa::Instance p : parts.instances()) {
    if (p.get<int>("quantity") < 10) p.set("quantity", 100);
    std::optional<double> weight = p.try_get<double>("weight");        // empty when no value
  }
  corvexa::Instance hinge = parts.create();
  hinge.set("number", std::string("P-2001"));
  hinge.set("tags", std::vector<std::string>{"hinge", "steel"});
  inv.commit();
  inv.write_binary_file("inventory.bin", corvexa::Compression::on);
  corvexa::Replica back = corvexa::Replica::read_binary_file("inventory.bin");
  std::cout << back.model("Part").instances().size() << " parts\n";
} catch (const corvexa::Error& e) {
  std::cerr << e.what() << '\n';   // the operation, the cause, and the last error's id
  return 1;
}
