#include "b_attribute_desc.h"
#include "scene_schema_registry.h"
#include "scenetool_app.h"

#include <fmt/format.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <memory>
#include <string_view>
#include <vector>

namespace scenetool {
namespace {

struct SchemaOptions {
  std::string type;
  bool json = false;
};

using JsonWriter = rapidjson::Writer<rapidjson::StringBuffer>;

void writeString(JsonWriter& writer, std::string_view text) {
  writer.String(text.data(), static_cast<rapidjson::SizeType>(text.size()));
}

// The schema and its bases, the most derived first.
std::vector<const scene::SchemaInfo*> lineage(const scene::SchemaInfo& schema) {
  std::vector<const scene::SchemaInfo*> chain{&schema};
  while (chain.back()->base) chain.push_back(scene::findSchema(chain.back()->base));
  return chain;
}

// One attribute of a schema with what the description set says of it.
struct AttributeRow {
  std::string_view name;
  std::string_view declaredBy;
  const base::AttribDesc* desc;
};

// The attributes of a schema and its bases, the bases' first, each in declaration order.
std::vector<AttributeRow> attributeRows(const scene::SchemaInfo& schema) {
  std::vector<AttributeRow> rows;
  const auto chain = lineage(schema);
  for (auto declaring = chain.rbegin(); declaring != chain.rend(); ++declaring) {
    const base::name_id type = base::intern((*declaring)->type);
    for (const char* name : (*declaring)->names) {
      rows.push_back({name, (*declaring)->type, base::attribDescManager().findAttribute(type, name)});
    }
  }
  return rows;
}

void printTypesJson() {
  rapidjson::StringBuffer buffer;
  JsonWriter writer(buffer);
  writer.StartObject();
  writer.Key("types");
  writer.StartArray();
  for (const scene::SchemaInfo& schema : scene::schemas()) {
    if (schema.kind != scene::SchemaKind::sceneType) continue;
    writer.StartObject();
    writer.Key("name");
    writeString(writer, schema.type);
    writer.Key("interface");
    writeString(writer, schema.interfaceName);
    writer.Key("bases");
    writer.StartArray();
    for (const scene::SchemaInfo* base : lineage(schema)) {
      if (base != &schema) writeString(writer, base->type);
    }
    writer.EndArray();
    writer.EndObject();
  }
  writer.EndArray();
  writer.EndObject();
  fmt::print("{}\n", buffer.GetString());
}

void printTypes() {
  for (const scene::SchemaInfo& schema : scene::schemas()) {
    if (schema.kind != scene::SchemaKind::sceneType) continue;
    std::string bases;
    for (const scene::SchemaInfo* base : lineage(schema)) {
      if (base != &schema) bases += fmt::format("{}{}", bases.empty() ? " : " : ", ", base->type);
    }
    fmt::print("{} ({}){}\n", schema.type, schema.interfaceName, bases);
  }
}

// A text of the description, null when there is none.
void writeOptionalString(JsonWriter& writer, const char* key, const base::AttribDesc* desc,
                         const base::string base::AttribDesc::*field) {
  writer.Key(key);
  if (desc && !(desc->*field).empty()) {
    writeString(writer, desc->*field);
  } else {
    writer.Null();
  }
}

void printSchemaJson(const scene::SchemaInfo& schema) {
  rapidjson::StringBuffer buffer;
  JsonWriter writer(buffer);
  writer.StartObject();
  writer.Key("name");
  writeString(writer, schema.type);
  writer.Key("attributes");
  writer.StartArray();
  for (const AttributeRow& row : attributeRows(schema)) {
    writer.StartObject();
    writer.Key("name");
    writeString(writer, row.name);
    writer.Key("type");
    if (row.desc && row.desc->type) {
      writeString(writer, base::text(row.desc->type));
    } else {
      writer.Null();
    }
    writeOptionalString(writer, "default", row.desc, &base::AttribDesc::defaultValue);
    writeOptionalString(writer, "label", row.desc, &base::AttribDesc::label);
    writeOptionalString(writer, "help", row.desc, &base::AttribDesc::help);
    writer.Key("declaredBy");
    writeString(writer, row.declaredBy);
    writer.EndObject();
  }
  writer.EndArray();
  writer.EndObject();
  fmt::print("{}\n", buffer.GetString());
}

void printSchema(const scene::SchemaInfo& schema) {
  fmt::print("{}{}\n", schema.type, *schema.interfaceName ? fmt::format(" ({})", schema.interfaceName) : "");
  for (const AttributeRow& row : attributeRows(schema)) {
    const bool inherited = row.declaredBy != schema.type;
    if (!row.desc) {
      fmt::print("  {} (no description){}\n", row.name, inherited ? fmt::format(" from {}", row.declaredBy) : "");
      continue;
    }
    fmt::print("  {} : {}{}{}{}\n", row.name, row.desc->type ? base::text(row.desc->type) : "?",
               row.desc->defaultValue.empty() ? std::string() : fmt::format(" = {}", row.desc->defaultValue),
               inherited ? fmt::format(" (from {})", row.declaredBy) : "",
               row.desc->help.empty() ? std::string() : fmt::format("  {}", row.desc->help));
  }
}

int runSchema(const SchemaOptions& options) {
  if (options.type.empty()) {
    options.json ? printTypesJson() : printTypes();
    return exitOk;
  }
  const scene::SchemaInfo* schema = scene::findSchema(options.type);
  if (!schema) {
    printError(fmt::format("no scene schema is called '{}'; 'scenetool schema' lists the scene types", options.type));
    return exitUsage;
  }
  options.json ? printSchemaJson(*schema) : printSchema(*schema);
  return exitOk;
}

}  // namespace

Command addSchemaCommand(CLI::App& app) {
  auto options = std::make_shared<SchemaOptions>();
  CLI::App* command = app.add_subcommand(
      "schema", "List the scene types, or one type's attributes with their types, defaults and help");
  command->add_option("TYPE", options->type,
                      "A scene type (mesh, node, ...) or a nested record or parameter set (meshPrimitive, "
                      "sceneImporter, ...)");
  command->add_flag("--json", options->json, "Write JSON instead of text");
  return {command, [options] { return runSchema(*options); }};
}

}  // namespace scenetool
